// Reads the entries of a binary document's root dictionary one at a time.
#include <algorithm>
#include <numeric>
#include <utility>

#include "plist/internal/BinaryReader.h"

namespace appsync::plist {

bool BinaryReader::beginEntries() {
  forgetsEntries_ = true;
  readTrailer();
  std::size_t at = 0;
  if (failure_ || !locate(top_, at)) return false;
  const unsigned marker = std::to_integer<unsigned>(begin_[at]);
  return markerOf(marker) == Marker::dictionary && readExtent(at, lowOf(marker), entries_) &&
         fits(at, entries_, std::uint64_t{2} * referenceSize_) &&
         checkOverlap(top_, at, entries_.count * 2 * referenceSize_) && expand({2 * entries_.count, 0}, at);
}

Result<std::vector<std::size_t>> BinaryReader::checkEntries() {
  std::vector<std::size_t> places(static_cast<std::size_t>(entries_.count));
  std::iota(places.begin(), places.end(), std::size_t{0});
  for (const std::size_t place : places) {
    if (entryKey(place).type() == Type::null) return *std::move(failure_);
  }
  for (const std::size_t place : places) {
    if (entryValue(place).type() == Type::null) return *std::move(failure_);
  }
  startAgain();  // Sorting has a separate expansion limit.
  sortByKey(places);
  if (failure_) return *std::move(failure_);
  return places;
}

void BinaryReader::sortByKey(std::vector<std::size_t>& places) {
  const auto isBefore = [this](std::size_t one, std::size_t other) {
    const Value left = entryKey(one);
    const Value right = entryKey(other);
    return !failure_ && *left.string() < *right.string();  // Without an order, sorting terminates.
  };
  const auto isNotBefore = [&](std::size_t one, std::size_t other) { return !isBefore(one, other); };
  if (std::ranges::adjacent_find(places, isNotBefore) == places.end()) return;
  std::ranges::stable_sort(places, isBefore);
  // Of equal keys the last one wins: in reverse order it is the first.
  const auto kept = std::unique(places.rbegin(), places.rend(),
                                [&](std::size_t one, std::size_t other) { return !isBefore(other, one); });
  places.erase(places.begin(), kept.base());
}

Value BinaryReader::entryKey(std::size_t place) {
  forgetShared();
  const std::size_t at = entries_.start + place * referenceSize_;
  Value key;
  readObject(reference(at), 1, key);
  if (key.type() != Type::string) return fail(Failure::malformed, "A key that is not a string", at);
  return key;
}

Value BinaryReader::entryValue(std::size_t place) {
  forgetShared();
  Value value;
  readObject(reference(entries_.start + (static_cast<std::size_t>(entries_.count) + place) * referenceSize_), 1, value);
  return value;
}

/// Content that entries share is read again for each entry, and counts as if it were shared within one.
void BinaryReader::forgetShared() {
  for (const std::uint64_t number : seenInEntry_)
    seen_.erase(number);
  seenInEntry_.clear();
  if (!shared_.empty()) shared_ = {};
}

}  // namespace appsync::plist
