// The numbered objects of a binary document during writing.
#pragma once

#include <cstddef>
#include <cstdint>
#include <cstring>
#include <span>
#include <vector>

#include "base/SeededHash.h"
#include "plist/internal/Storage.h"

namespace appsync::plist {

/// The offset of each object, and an index of the scalars, so that equal ones are stored once. Reals and dates are
/// equal if their bits are. The values must not be moved while the table is in use.
class ObjectTable {
 public:
  /// Reuses the memory of the thread's previous table. `clear` must be called first.
  ObjectTable();
  ~ObjectTable();
  ObjectTable(const ObjectTable&) = delete;
  ObjectTable& operator=(const ObjectTable&) = delete;

  /// Removes all objects, and reserves memory for about `expected`.
  void clear(std::size_t expected);

  /// Adds an object at `offset` and returns its number.
  std::uint32_t add(std::size_t offset) {
    if (count_ == memory_.offsets.size()) makeRoom(count_ + 1);
    memory_.offsets[count_] = static_cast<std::uint32_t>(offset);
    return count_++;
  }
  /// Returns the number of an equal scalar, or adds the scalar at `offset` and returns its number.
  std::uint32_t findOrAdd(const Value& scalar, std::size_t offset) {
    const std::uint32_t tag = tagOf(scalar);
    for (std::size_t at = tag & mask_;; at = (at + 1) & mask_) {
      const Slot slot = slots_[at];
      if (slot.next == 0) return addAt(at, tag, scalar, offset);
      if (slot.tag == tag && isSame(*memory_.scalars[slot.next - 1], scalar)) return slot.next - 1;
    }
  }
  [[nodiscard]] std::size_t size() const noexcept { return count_; }
  [[nodiscard]] std::span<const std::uint32_t> offsets() const noexcept {
    return std::span(memory_.offsets).first(count_);
  }

 private:
  struct Slot {
    /// The object's number plus 1, or 0 in an empty slot.
    std::uint32_t next;
    std::uint32_t tag;
  };
  struct Memory {
    /// Offsets of the objects; its size is the capacity.
    std::vector<std::uint32_t> offsets;
    /// Parallel to `offsets`; unset for containers.
    std::vector<const Value*> scalars;
    /// Hash tables of growing size one after another; the last one is in use.
    std::vector<Slot> slots;
  };

  [[nodiscard]] std::uint32_t tagOf(const Value& scalar) const noexcept;
  [[nodiscard]] static bool isSame(const Value& one, const Value& other) noexcept;
  [[nodiscard]] static bool isSameLong(const Value& one, const Value& other) noexcept;
  std::uint32_t addAt(std::size_t at, std::uint32_t tag, const Value& scalar, std::size_t offset);
  void makeRoom(std::size_t count);
  void beginTable(std::size_t start, std::size_t count);
  void grow();

  Memory memory_;
  std::uint32_t count_ = 0;
  Slot* slots_ = nullptr;
  std::size_t mask_ = 0;
  std::size_t used_ = 0;
  const std::uint64_t secret_ = secretOfProcess();
  static thread_local Memory spare;
};

inline std::uint32_t ObjectTable::tagOf(const Value& scalar) const noexcept {
  const std::uint64_t hash = Internals::isInline(scalar) ? hashBlock(Internals::words(scalar), secret_)
                                                         : hashText(Internals::text(scalar), secret_);
  return static_cast<std::uint32_t>(hash >> 32);
}

inline bool ObjectTable::isSame(const Value& one, const Value& other) noexcept {
  const auto left = Internals::words(one);
  const auto right = Internals::words(other);
  const std::uint64_t difference =
      (left[0] ^ right[0]) | (left[1] ^ right[1]) | (left[2] ^ right[2]) | (left[3] ^ right[3]);
  return difference == 0 || (!Internals::isInline(one) && isSameLong(one, other));
}

inline std::uint32_t ObjectTable::addAt(std::size_t at, std::uint32_t tag, const Value& scalar, std::size_t offset) {
  const std::uint32_t number = add(offset);
  memory_.scalars[number] = &scalar;
  slots_[at] = {number + 1, tag};
  if (++used_ * 2 > mask_) grow();
  return number;
}

}  // namespace appsync::plist
