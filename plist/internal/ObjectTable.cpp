#include "plist/internal/ObjectTable.h"

#include <algorithm>
#include <bit>
#include <utility>

namespace appsync::plist {

namespace {

constexpr std::size_t kFewestSlots = 256;
/// The largest initial table: most values of a large document may be equal scalars.
constexpr std::size_t kMostFirstSlots = 65536;
/// The most memory, about one megabyte, that a thread keeps for its next document.
constexpr std::size_t kMostSpareSlots = 90000;

}  // namespace

thread_local ObjectTable::Memory ObjectTable::spare;

ObjectTable::ObjectTable() : memory_(std::exchange(spare, {})) {}

ObjectTable::~ObjectTable() {
  if (std::max(memory_.slots.size(), memory_.offsets.size()) <= kMostSpareSlots) spare = std::move(memory_);
}

void ObjectTable::clear(std::size_t expected) {
  count_ = 0;
  used_ = 0;
  beginTable(0, std::bit_ceil(std::clamp(expected, kFewestSlots, kMostFirstSlots)));
}

bool ObjectTable::isSameLong(const Value& one, const Value& other) noexcept {
  return !Internals::isInline(other) && one.type() == other.type() && Internals::text(one) == Internals::text(other);
}

void ObjectTable::makeRoom(std::size_t count) {
  memory_.offsets.resize(std::max(count, memory_.offsets.size() * 2));
  memory_.scalars.resize(memory_.offsets.size());
}

void ObjectTable::beginTable(std::size_t start, std::size_t count) {
  if (memory_.slots.size() < start + count) memory_.slots.resize(start + count);
  slots_ = memory_.slots.data() + start;
  mask_ = count - 1;
  std::memset(slots_, 0, count * sizeof(Slot));
}

void ObjectTable::grow() {
  const std::size_t oldCount = mask_ + 1;
  const auto oldStart = static_cast<std::size_t>(slots_ - memory_.slots.data());
  beginTable(oldStart + oldCount, oldCount * 4);
  for (std::size_t i = 0; i < oldCount; ++i) {
    const Slot slot = memory_.slots[oldStart + i];
    if (slot.next == 0) continue;
    std::size_t at = slot.tag & mask_;
    while (slots_[at].next != 0)
      at = (at + 1) & mask_;
    slots_[at] = slot;
  }
}

}  // namespace appsync::plist
