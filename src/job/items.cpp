#include "job/items.h"

#include "platform/platform.h"

namespace vox {

std::unique_ptr<ParamBlock> ParamBlock::Create(uint16_t size) {
  std::unique_ptr<ParamBlock> block(new ParamBlock(size));
  // The header's first word (meaningful size) starts at 0; the second holds the allocation.
  block->data()[0] = 0;
  block->data()[1] = 0;
  block->data()[2] = static_cast<uint8_t>(size & 0xFF);
  block->data()[3] = static_cast<uint8_t>(size >> 8);
  return block;
}

uint16_t ParamBlock::allocated() const {
  return static_cast<uint16_t>(bytes_[2] | (bytes_[3] << 8));
}

std::unique_ptr<ParamBlock> ParamBlock::Copy() const {
  // The header says how much to copy; never read past what this block really holds, even
  // if an engine rewrote the header with a larger size.
  const size_t stated = allocated();
  const size_t count = stated < size_ ? stated : size_;
  std::unique_ptr<ParamBlock> copy(new ParamBlock(stated));
  std::memcpy(copy->bytes_.get(), bytes_.get(), count < 4 ? 4 : count);
  return copy;
}

namespace {

// The part after the last '\' or '/' (the whole text without one).
std::string AfterLastSeparator(const std::string& path) {
  const size_t sep = path.find_last_of("\\/");
  return sep == std::string::npos ? path : path.substr(sep + 1);
}

}  // namespace

TChainItem::TChainItem(uint32_t number, std::string path_in, bool temporary_in, bool smooth_in)
    : id(kFileTag + number),
      file_name(AfterLastSeparator(platform::AnsiFromPath(path_in))),
      path(std::move(path_in)),
      occupations(true),
      temporary(temporary_in),
      smooth(smooth_in) {}

TPointItem::TPointItem(uint32_t number) : id(kPointTag + number), base_id(kPointTag + number) {}

TPointItem::TPointItem(uint32_t number, const TPointItem& other)
    : id(kPointTag + number),
      base_id(kPointTag + number),
      name(other.name),
      x(other.x),
      y(other.y),
      z(other.z),
      rms(other.rms),
      type(other.type),
      occupations(true),
      nav_mean(other.nav_mean),
      solved_x(other.solved_x),
      solved_y(other.solved_y),
      solved_z(other.solved_z),
      solved_rms(other.solved_rms),
      nav_mean_set(other.nav_mean_set),
      solved_set(other.solved_set) {}

bool TOccupItem::SetAntenna(TAntennItem* a) {
  if (a == nullptr || antenna != nullptr) return false;
  antenna = a;
  return true;
}

bool TOccupItem::SetReceiver(TReceiverItem* r) {
  if (r == nullptr || receiver != nullptr) return false;
  receiver = r;
  return true;
}

bool TOccupItem::SetFile(TChainItem* f) {
  if (f == nullptr || file != nullptr) return false;
  file = f;
  f->occupations.Append(new TROccupItem(this));
  return true;
}

bool TOccupItem::SetPoint(TPointItem* p) {
  if (p == nullptr || point != nullptr) return false;
  point = p;
  p->occupations.Append(new TROccupItem(this));
  return true;
}

}  // namespace vox
