// The cursor of the item streams that engines walk (occupations, linked occupations, points,
// fans): the current item and a first-call flag, so that the first step yields the list's
// head and every step after the end yields nothing again.
//
// A cursor belongs to the engine thread that opened it; the lists it walks do not change
// while engines run.
#pragma once

namespace vox {

template <typename T>
struct ItemCursor {
  explicit ItemCursor(T* head) : current(head) {}

  // The next item, or null at the end (and on every call after it).
  T* Next() {
    if (current == nullptr) return nullptr;
    if (!first) {
      current = current->next;
      if (current == nullptr) return nullptr;
    }
    first = false;
    return current;
  }

  T* current;
  bool first = true;
};

}  // namespace vox
