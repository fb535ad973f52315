// Intrusive singly linked lists of job items: Link<T> is the base of every item class T, and
// ItemList<T> is a head pointer that owns (or only references) its items. The list remembers
// its last item, so that a job of many thousand points is not built in quadratic time; an
// item linked in by hand after the remembered one (the ephemeris store inserts in time order)
// is found by walking on from it, since items leave a list only when it is cleared.
#pragma once

#include <cstddef>
#include <iterator>
#include <memory>
#include <utility>

namespace vox {

template <typename T>
struct Link {
  virtual ~Link() = default;
  T* next = nullptr;
};

template <typename T>
class ItemList {
 public:
  // owning: clearing the list destroys its items (through their virtual destructor).
  explicit ItemList(bool owning = true) : owning_(owning) {}
  ~ItemList() { Clear(); }
  ItemList(const ItemList&) = delete;
  ItemList& operator=(const ItemList&) = delete;
  ItemList(ItemList&& other) noexcept
      : head_(std::exchange(other.head_, nullptr)),
        tail_(std::exchange(other.tail_, nullptr)),
        owning_(other.owning_) {}

  T* head() const { return head_; }
  bool empty() const { return head_ == nullptr; }

  // Links item at the tail; a null item does nothing and yields null.
  T* Append(T* item) {
    if (item == nullptr) return nullptr;
    item->next = nullptr;
    if (head_ == nullptr) {
      head_ = tail_ = item;
      return item;
    }
    T* last = tail_ != nullptr ? tail_ : head_;
    while (last->next != nullptr) last = last->next;
    last->next = item;
    tail_ = item;
    return item;
  }
  T* Append(std::unique_ptr<T> item) { return Append(item.release()); }

  // Links item at the head.
  T* Prepend(T* item) {
    if (item == nullptr) return nullptr;
    item->next = head_;
    head_ = item;
    if (tail_ == nullptr) tail_ = item;
    return item;
  }

  // The first item whose identifier equals id.
  T* FindById(uint32_t id) const {
    for (T* p = head_; p != nullptr; p = p->next)
      if (p->id == id) return p;
    return nullptr;
  }

  size_t Count() const {
    size_t n = 0;
    for (T* p = head_; p != nullptr; p = p->next) ++n;
    return n;
  }

  // Unlinks every item; destroys them when the list owns them.
  void Clear() {
    T* p = head_;
    head_ = nullptr;
    tail_ = nullptr;
    while (p != nullptr) {
      T* next = p->next;
      p->next = nullptr;
      if (owning_) delete p;
      p = next;
    }
  }

  class iterator {
   public:
    using iterator_category = std::forward_iterator_tag;
    using value_type = T;
    using difference_type = std::ptrdiff_t;
    using pointer = T*;
    using reference = T&;
    explicit iterator(T* p = nullptr) : p_(p) {}
    T& operator*() const { return *p_; }
    T* operator->() const { return p_; }
    iterator& operator++() {
      p_ = p_->next;
      return *this;
    }
    iterator operator++(int) {
      iterator old = *this;
      p_ = p_->next;
      return old;
    }
    bool operator==(const iterator& o) const { return p_ == o.p_; }

   private:
    T* p_;
  };
  iterator begin() const { return iterator(head_); }
  iterator end() const { return iterator(nullptr); }

 private:
  T* head_ = nullptr;
  T* tail_ = nullptr;  // the last item appended or prepended to an empty list
  bool owning_;
};

}  // namespace vox
