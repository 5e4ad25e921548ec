#include "plist/internal/BinaryReader.h"

#include <algorithm>
#include <cstring>
#include <utility>

#include "base/UTF8.h"
#include "plist/internal/Encoding.h"

namespace appsync::plist {

namespace {

constexpr std::string_view kMagic = "bplist00";
/// The trailer is as long as any fixed read ahead: everything before it can be read in whole words.
constexpr std::size_t kTrailerSize = 32;

/// UTF-16 of so many units is sure to fit into a value as UTF-8.
constexpr std::size_t kShortUTF16 = Internals::kInlineCapacity / 3;

/// From 32 - n on: n set bytes, then clear ones.
constexpr auto kMask = [] {
  std::array<std::uint8_t, 64> mask{};
  std::fill_n(mask.begin(), 32, std::uint8_t{0xFF});
  return mask;
}();

/// Of data, text in either form, arrays and dictionaries.
constexpr std::uint64_t bytesPerElement(unsigned type, unsigned referenceSize) {
  switch (type) {
    case 0x6:
      return 2;
    case 0xA:
      return referenceSize;
    case 0xD:
      return std::uint64_t{2} * referenceSize;
    default:
      return 1;
  }
}

constexpr Expansion expansionOf(unsigned type, std::uint64_t count) {
  switch (type) {
    case 0x4:
      return {};
    case 0x5:
    case 0x6:
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
    fail(Failure::malformed, "No binary property list", 0);
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
    fail(Failure::outOfRange, "Number sizes that do not exist in the trailer", trailer + 6);
  } else if (table <= kMagic.size() || table >= trailer) {
    fail(Failure::outOfRange, "An offset table outside the document", trailer + 24);
  } else if (objectCount_ == 0 || objectCount_ > (trailer - table) / offsetSize_) {
    fail(Failure::outOfRange, "More objects than the offset table holds", trailer + 8);
  } else if (top_ >= objectCount_) {
    fail(Failure::outOfRange, "A top object that does not exist", trailer + 16);
  }
  if (failure_) return;
  table_ = static_cast<std::size_t>(table);
  measured_.resize(objectCount_);
  seen_.resize(objectCount_);
}

inline bool BinaryReader::wasSeen(std::uint64_t number) {
  const bool isNew = seen_.insert(number);
  if (forgets_ && isNew) met_.push_back(number);
  return !isNew;
}

/// Objects that lie in each other would unfold without being referred to twice. Together they cannot be longer than
/// the document unless they do.
bool BinaryReader::checkOverlap(std::uint64_t number, std::size_t at, std::uint64_t bytes) {
  if (!measured_.insert(number)) return true;
  content_ += bytes;
  if (content_ <= table_) return true;
  fail(Failure::malformed, "Objects that lie in each other, met", at);
  return false;
}

bool BinaryReader::readLongExtent(std::size_t at, Extent& extent) {
  const unsigned marker = at + 1 < table_ ? std::to_integer<unsigned>(begin_[at + 1]) : 0;
  const unsigned size = 1U << (marker & 0xFU);
  if (marker >> 4 != 1 || size > 8 || size > table_ - (at + 2)) {
    fail(Failure::malformed, "A length that is no integer", at + 1);
    return false;
  }
  extent = {at + 2 + size, loadBigEndian(begin_ + at + 2, size)};
  return true;
}

/// False when the string is not short or not in order, and left to somebody else.
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
  // Most objects are short strings. Everything before the trailer can be read in whole blocks.
  const unsigned marker = std::to_integer<unsigned>(begin_[at]);
  if (marker >= 0x50 && marker < 0x5F) {
    if (readShortASCII(at + 1, marker & 0xFU, place)) return;
  } else if (marker == 0x5F && begin_[at + 1] == std::byte{0x10}) {
    if (readShortASCII(at + 3, std::to_integer<std::size_t>(begin_[at + 2]), place)) return;
  } else if (marker >= 0x60 && marker <= 0x60 + kShortUTF16) {
    if (readShortUTF16(at + 1, marker & 0xFU, place)) return;
  }
  readOther(number, at, depth, place);
}

/// False when the string is none of plain characters, and left to somebody else.
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
  const unsigned low = marker & 0xFU;
  switch (marker >> 4) {
    case 0x0:
      if (low == 8 || low == 9) {
        place = low == 9;
      } else {
        fail(Failure::unsupported, "A null or filler object", at);
      }
      return;
    case 0x1:
      place = readInteger(at, low);
      return;
    case 0x2:
      place = readReal(at, low);
      return;
    case 0x3:
      place = readDate(at, low);
      return;
    case 0x8:
      place = readUid(at, low + 1);
      return;
    case 0x4:
    case 0x5:
    case 0x6:
    case 0xA:
    case 0xD:
      return readLong(number, at, marker, depth, place);
    case 0xB:
    case 0xC:
      fail(Failure::unsupported, "A set, which is not supported,", at);
      return;
    default:
      fail(Failure::malformed, "An object of unknown type", at);
  }
}

inline void BinaryReader::readContent(std::uint64_t number, std::size_t at, unsigned marker, int depth, Value& place) {
  Extent extent{};
  if (!readExtent(at, marker & 0xFU, extent)) return;
  const unsigned type = marker >> 4;
  const std::uint64_t bytesEach = bytesPerElement(type, referenceSize_);
  const bool isSound = fits(at, extent, bytesEach) && checkOverlap(number, at, extent.count * bytesEach) &&
                       expand(expansionOf(type, extent.count), at);
  if (!isSound) return;
  switch (type) {
    case 0x4:
      place = readData({begin_ + extent.start, static_cast<std::size_t>(extent.count)});
      return;
    case 0x5:
      place = readASCII(at, extent);
      return;
    case 0x6:
      place = readUTF16(extent);
      return;
    case 0xA:
      return readArray(at, extent, depth + 1, place);
    default:
      return readDictionary(at, extent, depth + 1, place);
  }
}

void BinaryReader::readLong(std::uint64_t number, std::size_t at, unsigned marker, int depth, Value& place) {
  const bool again = wasSeen(number);
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

/// Null when they cannot be read, or when two of them are equal.
BinaryReader::KnownKeys* BinaryReader::keysOf(Extent extent, int depth) {
  const std::byte* references = begin_ + extent.start;
  const std::size_t size = static_cast<std::size_t>(extent.count) * referenceSize_;
  const std::uint64_t last = loadBigEndian(references + size - referenceSize_, referenceSize_);
  KnownKeys& known = knownKeys_[(reference(extent.start) * 7 + last + extent.count) % knownKeys_.size()];
  if (known.size == size && std::memcmp(known.references, references, size) == 0) {
    return expand({extent.count, 0}, extent.start) ? &known : nullptr;
  }
  known = KnownKeys{};
  if (!learnKeys(known, extent, depth)) return nullptr;
  known.references = references;
  known.size = size;
  return &known;
}

/// False when they cannot be read, or when two of them are equal.
bool BinaryReader::learnKeys(KnownKeys& known, Extent extent, int depth) {
  if (!expand({extent.count, 0}, extent.start)) return false;
  std::vector<Value> keys(static_cast<std::size_t>(extent.count));
  std::size_t at = extent.start;
  for (Value& key : keys) {
    readObject(reference(at), depth, key);
    if (key.type() != Type::string) fail(Failure::malformed, "A key that is no string", at);
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

  // Kept here, because the keys of dictionaries within may displace the known ones.
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

/// One with equal keys under different references: the last value counts.
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
