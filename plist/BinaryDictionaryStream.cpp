// Reads the entries of a binary document's root one by one.
#include <algorithm>
#include <numeric>
#include <utility>

#include "plist/internal/BinaryReader.h"

namespace appsync::plist {

bool BinaryReader::beginEntries() {
  forgets_ = true;
  readTrailer();
  std::size_t at = 0;
  if (failure_ || !locate(top_, at)) return false;
  const unsigned marker = std::to_integer<unsigned>(begin_[at]);
  return marker >> 4 == 0xD && readExtent(at, marker & 0xFU, entries_) &&
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
  startAgain();  // so that sorting has a bound of its own
  sortByKey(places);
  if (failure_) return *std::move(failure_);
  return places;
}

void BinaryReader::sortByKey(std::vector<std::size_t>& places) {
  const auto isBefore = [this](std::size_t one, std::size_t other) {
    const Value left = entryKey(one);
    const Value right = entryKey(other);
    return !failure_ && *left.string() < *right.string();  // without an order, sorting comes to an end
  };
  const auto isNotBefore = [&](std::size_t one, std::size_t other) { return !isBefore(one, other); };
  if (std::ranges::adjacent_find(places, isNotBefore) == places.end()) return;
  std::ranges::stable_sort(places, isBefore);
  // Of equal keys the last one stays: in reverse it comes first.
  const auto kept = std::unique(places.rbegin(), places.rend(),
                                [&](std::size_t one, std::size_t other) { return !isBefore(other, one); });
  places.erase(places.begin(), kept.base());
}

Value BinaryReader::entryKey(std::size_t place) {
  forgetWhatWasShared();
  const std::size_t at = entries_.start + place * referenceSize_;
  Value key;
  readObject(reference(at), 1, key);
  if (key.type() != Type::string) return fail(Failure::malformed, "A key that is no string", at);
  return key;
}

Value BinaryReader::entryValue(std::size_t place) {
  forgetWhatWasShared();
  Value value;
  readObject(reference(entries_.start + (static_cast<std::size_t>(entries_.count) + place) * referenceSize_), 1, value);
  return value;
}

/// What entries have in common is read for each again, and counted as often as where it is shared.
void BinaryReader::forgetWhatWasShared() {
  for (const std::uint64_t number : met_)
    seen_.erase(number);
  met_.clear();
  if (!shared_.empty()) shared_ = {};
}

}  // namespace appsync::plist
