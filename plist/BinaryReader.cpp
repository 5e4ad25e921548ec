#include "plist/internal/BinaryReader.h"

#include <algorithm>
#include <cstring>
#include <utility>

#include "base/UTF8.h"
#include "plist/internal/Encoding.h"

namespace appsync::plist {

namespace {

/// UTF-16 of this many units always fits into a value as UTF-8.
constexpr std::size_t kShortUTF16 = Internals::kInlineCapacity / 3;

/// From 32 - n on: n bytes of ones, then zeros.
constexpr auto kMask = [] {
  std::array<std::uint8_t, 64> mask{};
  std::fill_n(mask.begin(), 32, std::uint8_t{0xFF});
  return mask;
}();

/// Returns the bytes per element of the variable-length object types.
constexpr std::uint64_t bytesPerElement(Marker type, unsigned referenceSize) {
  switch (type) {
    case Marker::utf16:
      return 2;
    case Marker::array:
      return referenceSize;
    case Marker::dictionary:
      return std::uint64_t{2} * referenceSize;
    default:
      return 1;
  }
}

constexpr Expansion expansionOf(Marker type, std::uint64_t count) {
  switch (type) {
    case Marker::data:
      return {};
    case Marker::ascii:
    case Marker::utf16:
      return {0, count};
    default:
      return {count, 0};
  }
}

}  // namespace

Value BinaryReader::fail(Failure kind, std::string_view what, std::size_t at) {
  if (!failure_) failure_ = failureAt(kind, what, at);
  return {};
}

void BinaryReader::failMissing(std::uint64_t number) {
  fail(Failure::outOfRange, "Object " + std::to_string(number) + " does not exist; the table begins", table_);
}

void BinaryReader::readTrailer() {
  if (size_ < kMagic.size() || std::memcmp(begin_, kMagic.data(), kMagic.size()) != 0) {
    fail(Failure::malformed, "Not a binary property list", 0);
    return;
  }
  if (size_ < kMagic.size() + kTrailerSize + 2) {
    fail(Failure::truncated, "The binary property list ends too early", size_);
    return;
  }
  const std::size_t trailer = size_ - kTrailerSize;
  offsetSize_ = std::to_integer<unsigned>(begin_[trailer + 6]);
  referenceSize_ = std::to_integer<unsigned>(begin_[trailer + 7]);
  objectCount_ = loadBigEndian(begin_ + trailer + 8, 8);
  top_ = loadBigEndian(begin_ + trailer + 16, 8);
  const std::uint64_t table = loadBigEndian(begin_ + trailer + 24, 8);
  if (offsetSize_ < 1 || offsetSize_ > 8 || referenceSize_ < 1 || referenceSize_ > 8) {
    fail(Failure::outOfRange, "Invalid number sizes in the trailer", trailer + 6);
  } else if (table <= kMagic.size() || table >= trailer) {
    fail(Failure::outOfRange, "An offset table outside the document", trailer + 24);
  } else if (objectCount_ == 0 || objectCount_ > (trailer - table) / offsetSize_) {
    fail(Failure::outOfRange, "More objects than the offset table has entries", trailer + 8);
  } else if (top_ >= objectCount_) {
    fail(Failure::outOfRange, "A root object that does not exist", trailer + 16);
  }
  if (failure_) return;
  table_ = static_cast<std::size_t>(table);
  measured_.resize(objectCount_);
  seen_.resize(objectCount_);
}

inline bool BinaryReader::isRepeated(std::uint64_t number) {
  const bool isNew = seen_.insert(number);
  if (forgetsEntries_ && isNew) seenInEntry_.push_back(number);
  return !isNew;
}

/// Adds the size of the object's content. Fails if all content together is longer than the document: then objects
/// overlap, and could expand without repeated references.
bool BinaryReader::checkOverlap(std::uint64_t number, std::size_t at, std::uint64_t bytes) {
  if (!measured_.insert(number)) return true;
  content_ += bytes;
  if (content_ <= table_) return true;
  fail(Failure::malformed, "Overlapping objects, detected", at);
  return false;
}

bool BinaryReader::readLongExtent(std::size_t at, Extent& extent) {
  const unsigned marker = at + 1 < table_ ? std::to_integer<unsigned>(begin_[at + 1]) : 0;
  const unsigned size = 1U << lowOf(marker);
  if (markerOf(marker) != Marker::integer || size > 8 || size > table_ - (at + 2)) {
    fail(Failure::malformed, "A length that is not an integer", at + 1);
    return false;
  }
  extent = {at + 2 + size, loadBigEndian(begin_ + at + 2, size)};
  return true;
}

/// Returns false if the string is long or invalid; readOther then reads it.
inline bool BinaryReader::readShortASCII(std::size_t start, std::size_t size, Value& place) {
  if (size > Internals::kInlineCapacity || start + size > table_) return false;
  Internals::Words words;
  std::uint64_t all = 0;
  for (std::size_t i = 0; i < words.size(); ++i) {
    std::uint64_t mask;
    std::memcpy(&words[i], begin_ + start + 8 * i, sizeof mask);
    std::memcpy(&mask, kMask.data() + 32 - size + 8 * i, sizeof mask);
    all |= words[i] &= mask;
  }
  if ((all & 0x8080808080808080U) != 0) return false;
  Internals::setShortString(place, words, size);
  return true;
}

bool BinaryReader::locate(std::uint64_t number, std::size_t& at) {
  if (number >= objectCount_) {
    failMissing(number);
    return false;
  }
  const std::size_t entry = table_ + static_cast<std::size_t>(number) * offsetSize_;
  const std::uint64_t offset = loadBigEndian(begin_ + entry, offsetSize_);
  at = static_cast<std::size_t>(offset);
  if (offset >= kMagic.size() && offset < table_) return true;
  fail(Failure::outOfRange, "An offset outside the objects", entry);
  return false;
}

void BinaryReader::readObject(std::uint64_t number, int depth, Value& place) {
  std::size_t at;
  if (!locate(number, at)) return;
  // Fast path: most objects are short strings. Everything before the trailer can be read in whole blocks.
  constexpr unsigned kASCII = markerByte(Marker::ascii);
  constexpr unsigned kUTF16 = markerByte(Marker::utf16);
  const unsigned marker = std::to_integer<unsigned>(begin_[at]);
  if (marker >= kASCII && marker < kASCII + kLongCount) {
    if (readShortASCII(at + 1, lowOf(marker), place)) return;
  } else if (marker == kASCII + kLongCount && begin_[at + 1] == std::byte{markerByte(Marker::integer)}) {
    if (readShortASCII(at + 3, std::to_integer<std::size_t>(begin_[at + 2]), place)) return;
  } else if (marker >= kUTF16 && marker <= kUTF16 + kShortUTF16) {
    if (readShortUTF16(at + 1, lowOf(marker), place)) return;
  }
  readOther(number, at, depth, place);
}

/// Returns false if the string is truncated or has surrogates; readOther then reads it.
bool BinaryReader::readShortUTF16(std::size_t start, std::size_t count, Value& place) {
  if (start + 2 * count > table_) return false;
  char text[sizeof(Value)] = {};
  char* end = text;
  for (const std::byte* unit = begin_ + start; count > 0; --count, unit += 2) {
    const auto c = static_cast<char32_t>(loadBigEndian(unit, 2));
    if (isSurrogate(c)) return false;
    if (c < 0x80) {
      *end++ = static_cast<char>(c);
    } else {
      end = writeCharacter(c, end);
    }
  }
  Internals::Words words;
  std::memcpy(&words, text, sizeof words);
  Internals::setShortString(place, words, static_cast<std::size_t>(end - text));
  return true;
}

void BinaryReader::readOther(std::uint64_t number, std::size_t at, int depth, Value& place) {
  const unsigned marker = std::to_integer<unsigned>(begin_[at]);
  const unsigned low = lowOf(marker);
  switch (markerOf(marker)) {
    case Marker::boolean:
      if (low == kFalse || low == kTrue) {
        place = low == kTrue;
      } else {
        fail(Failure::unsupported, "A null or filler object", at);
      }
      return;
    case Marker::integer:
      place = readInteger(at, low);
      return;
    case Marker::real:
      place = readReal(at, low);
      return;
    case Marker::date:
      place = readDate(at, low);
      return;
    case Marker::uid:
      place = readUid(at, low + 1);
      return;
    case Marker::data:
    case Marker::ascii:
    case Marker::utf16:
    case Marker::array:
    case Marker::dictionary:
      return readLong(number, at, marker, depth, place);
    case Marker::orderedSet:
    case Marker::set:
      fail(Failure::unsupported, "A set, which is not supported,", at);
      return;
    default:
      fail(Failure::malformed, "An object of unknown type", at);
  }
}

inline void BinaryReader::readContent(std::uint64_t number, std::size_t at, unsigned marker, int depth, Value& place) {
  Extent extent{};
  if (!readExtent(at, lowOf(marker), extent)) return;
  const Marker type = markerOf(marker);
  const std::uint64_t bytesEach = bytesPerElement(type, referenceSize_);
  const bool isValid = fits(at, extent, bytesEach) && checkOverlap(number, at, extent.count * bytesEach) &&
                       expand(expansionOf(type, extent.count), at);
  if (!isValid) return;
  switch (type) {
    case Marker::data:
      place = readData({begin_ + extent.start, static_cast<std::size_t>(extent.count)});
      return;
    case Marker::ascii:
      place = readASCII(at, extent);
      return;
    case Marker::utf16:
      place = readUTF16(extent);
      return;
    case Marker::array:
      return readArray(at, extent, depth + 1, place);
    default:
      return readDictionary(at, extent, depth + 1, place);
  }
}

void BinaryReader::readLong(std::uint64_t number, std::size_t at, unsigned marker, int depth, Value& place) {
  const bool again = isRepeated(number);
  if (again) {
    if (const auto known = shared_.find(number); known != shared_.end()) {
      if (expand(known->second.expansion, at)) place = known->second.value;
      return;
    }
  }
  const Expansion before = expansion_;
  readContent(number, at, marker, depth, place);
  if (again && !failure_) shared_.try_emplace(number, Shared{place, expansion_ - before});
}

void BinaryReader::readArray(std::size_t at, Extent extent, int depth, Value& place) {
  if (depth > kMaximumDepth) {
    fail(Failure::tooDeep, "Containers nested too deep", at);
    return;
  }
  Array elements(static_cast<std::size_t>(extent.count));
  std::size_t next = extent.start;
  for (Value& element : elements) {
    readObject(reference(next), depth, element);
    if (failure_) return;
    next += referenceSize_;
  }
  place = std::move(elements);
}

/// Returns null if a key cannot be read or two keys are equal.
BinaryReader::KnownKeys* BinaryReader::keysOf(Extent extent, int depth) {
  const std::byte* references = begin_ + extent.start;
  const std::size_t size = static_cast<std::size_t>(extent.count) * referenceSize_;
  const std::uint64_t last = loadBigEndian(references + size - referenceSize_, referenceSize_);
  KnownKeys& known = knownKeys_[(reference(extent.start) * 7 + last + extent.count) % knownKeys_.size()];
  if (known.size == size && std::memcmp(known.references, references, size) == 0) {
    return expand({extent.count, 0}, extent.start) ? &known : nullptr;
  }
  known = KnownKeys{};
  if (!readKeys(known, extent, depth)) return nullptr;
  known.references = references;
  known.size = size;
  return &known;
}

/// Returns false if a key cannot be read or two keys are equal.
bool BinaryReader::readKeys(KnownKeys& known, Extent extent, int depth) {
  if (!expand({extent.count, 0}, extent.start)) return false;
  std::vector<Value> keys(static_cast<std::size_t>(extent.count));
  std::size_t at = extent.start;
  for (Value& key : keys) {
    readObject(reference(at), depth, key);
    if (key.type() != Type::string) fail(Failure::malformed, "A key that is not a string", at);
    if (failure_) return false;
    at += referenceSize_;
  }
  std::vector<Value> nulls(keys.size());
  const Dictionary sample = makeDictionary(keys, nulls);
  if (sample.size() != keys.size()) return false;
  known.pool = DictionaryPool(*Internals::payload(sample)->shape);
  auto places = placesOf(keys, *known.pool);
  if (!places.empty()) known.places = std::make_shared<const std::vector<std::uint32_t>>(std::move(places));
  return true;
}

void BinaryReader::readDictionary(std::size_t at, Extent extent, int depth, Value& place) {
  if (depth > kMaximumDepth) {
    fail(Failure::tooDeep, "Containers nested too deep", at);
    return;
  }
  const auto count = static_cast<std::size_t>(extent.count);
  if (count == 0) {
    place = Dictionary();
    return;
  }
  KnownKeys* known = keysOf(extent, depth);
  if (failure_) return;
  if (known == nullptr) return readRepeatingDictionary(extent, depth, place);

  // A copy: nested dictionaries may replace the cached keys.
  const auto places = known->places;
  Dictionary dictionary = known->pool.make();
  Value* const values = Internals::payload(dictionary)->values();
  const std::size_t first = extent.start + count * referenceSize_;
  for (std::size_t i = 0; i < count; ++i) {
    readObject(reference(first + i * referenceSize_), depth, values[places == nullptr ? i : (*places)[i]]);
    if (failure_) return;
  }
  place = std::move(dictionary);
}

/// Reads a dictionary that has equal keys under different references: the last value wins.
void BinaryReader::readRepeatingDictionary(Extent extent, int depth, Value& place) {
  const auto count = static_cast<std::size_t>(extent.count);
  std::vector<Value> keys(count);
  std::vector<Value> values(count);
  for (std::size_t i = 0; i < count; ++i) {
    readObject(reference(extent.start + i * referenceSize_), depth, keys[i]);
    readObject(reference(extent.start + (count + i) * referenceSize_), depth, values[i]);
    if (failure_) return;
  }
  place = makeDictionary(keys, values);
}

Result<Value> readBinary(ByteView document) {
  return BinaryReader(document).read();
}

}  // namespace appsync::plist
