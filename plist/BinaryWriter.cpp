// Writes the binary format in one pass: every object is written after the objects that it refers to, the root last.
#include <algorithm>
#include <array>
#include <bit>
#include <span>
#include <unordered_map>

#include "base/UTF8.h"
#include "plist/internal/BigEndian.h"
#include "plist/internal/BinaryFormat.h"
#include "plist/internal/Date.h"
#include "plist/internal/Encoding.h"
#include "plist/internal/Failure.h"
#include "plist/internal/ObjectTable.h"
#include "plist/internal/Storage.h"

namespace appsync::plist {

namespace {

/// At least the size of any object without its text, data or references, and of the trailer.
constexpr std::size_t kMargin = 64;
/// Repeated scalars of at least this size are recognised by their storage: hashing them each time would take time
/// proportional to the expanded document.
constexpr std::size_t kLongScalar = 4096;
/// The largest initial size of the buffer: most values of a large document may be equal scalars.
constexpr std::size_t kLargestAtFirst = std::size_t{1} << 26;

unsigned bytesFor(std::uint64_t number) noexcept {
  if (number < 0x100) return 1;
  if (number < 0x10000) return 2;
  return number < 0x100000000 ? 4 : 8;
}

std::byte* writeMarker(Marker marker, unsigned low, std::byte* at) noexcept {
  return storeBigEndian(markerByte(marker, low), 1, at);
}

std::byte* writeInteger(std::uint64_t number, unsigned size, std::byte* at) noexcept {
  return storeBigEndian(number, size, writeMarker(Marker::integer, static_cast<unsigned>(std::countr_zero(size)), at));
}

/// Writes the marker and the number of elements.
std::byte* writeHead(Marker marker, std::size_t count, std::byte* at) noexcept {
  if (count < kLongCount) return writeMarker(marker, static_cast<unsigned>(count), at);
  if (count < 0x100) {
    return storeBigEndian(markerByte(marker, kLongCount) << 16 | markerByte(Marker::integer) << 8 | count, 3, at);
  }
  return writeInteger(count, bytesFor(count), writeMarker(marker, kLongCount, at));
}

std::byte* writeBytes(std::string_view bytes, std::byte* at) noexcept {
  if (!bytes.empty()) std::memcpy(at, bytes.data(), bytes.size());
  return at + bytes.size();
}

std::byte* writeInteger(const Value& value, std::byte* at) noexcept {
  if (const auto number = value.int64()) {
    const unsigned size = *number < 0 ? 8 : bytesFor(static_cast<std::uint64_t>(*number));
    return writeInteger(static_cast<std::uint64_t>(*number), size, at);
  }
  // Above the signed range: 16 bytes, because integers of 8 bytes are signed.
  return storeBigEndian(*value.uint64(), 8, storeBigEndian(0, 8, writeMarker(Marker::integer, 4, at)));
}

/// Writes a real or a date.
std::byte* writeDouble(Marker marker, double number, std::byte* at) noexcept {
  return storeBigEndian(std::bit_cast<std::uint64_t>(number), 8, writeMarker(marker, 3, at));
}

std::byte* writeUid(Uid uid, std::byte* at) noexcept {
  const unsigned size = bytesFor(uid.number);
  return storeBigEndian(uid.number, size, writeMarker(Marker::uid, size - 1, at));
}

/// Whether `string` is stored inline and ASCII. The length byte of a string on the heap is kShared (0xFF), whose high
/// bit makes this false.
bool isShortASCII(const Value& string) noexcept {
  const auto words = Internals::words(string);
  return ((words[0] | words[1] | words[2] | words[3]) & 0x8080808080808080U) == 0;
}

/// Copies the whole value, which is faster than the text alone. The excess is overwritten by the next object.
std::byte* writeShortASCII(const Value& string, std::byte* at) noexcept {
  const std::size_t size = Internals::inlineSize(string);
  at = writeHead(Marker::ascii, size, at);
  std::memcpy(at, Internals::bits(string), sizeof string);
  return at + size;
}

template <unsigned kSize>
std::byte* writeNumbers(std::span<const std::uint32_t> numbers, std::byte* at) noexcept {
  for (const std::uint32_t number : numbers)
    at = storeBigEndian(number, kSize, at);
  return at;
}

std::byte* writeNumbers(std::span<const std::uint32_t> numbers, unsigned size, std::byte* at) noexcept {
  switch (size) {
    case 1:
      return writeNumbers<1>(numbers, at);
    case 2:
      return writeNumbers<2>(numbers, at);
    default:
      return writeNumbers<4>(numbers, at);
  }
}

/// The size of a document, estimated before it is written.
struct Measure {
  std::size_t values = 0;
  std::size_t containers = 0;
  /// An upper bound, except for text that is not ASCII.
  std::size_t bytes = 0;
  /// Bytes of long text, counted at least as often as readers count it.
  std::size_t text = 0;
  bool isTooDeep = false;

  void add(std::span<const Value> several, int depth) {
    values += several.size();
    bytes += several.size() * 12;
    if (values > kMaximumValues) return;
    for (const Value& value : several) {
      if (Internals::isInline(value)) {
        bytes += Internals::inlineSize(value);
      } else if (!Internals::isContainer(value)) {
        bytes += Internals::text(value).size();
        text += textSize(value);
      } else {
        addContainer(value, depth + 1);
        if (isTooDeep || values > kMaximumValues) return;
      }
    }
  }

 private:
  static std::size_t textSize(const Value& longScalar) noexcept {
    return longScalar.type() == Type::string ? Internals::text(longScalar).size() : 0;
  }
  void addContainer(const Value& value, int depth) {
    ++containers;
    isTooDeep = isTooDeep || depth > kMaximumDepth;
    if (isTooDeep) return;
    if (const Array* array = value.array()) return add(*array, depth);
    DictionaryPayload* payload = Internals::payload(*value.dictionary());
    if (payload == nullptr) return;
    bytes += payload->count * std::size_t{4};
    if (payload->shape != latestShape_) addKeys(*payload->shape, depth);
    add({payload->values(), payload->count}, depth);
  }
  /// Shared keys are most likely stored already and take no space. Readers count their text again unless the previous
  /// dictionary has the same keys.
  void addKeys(const Shape& shape, int depth) {
    latestShape_ = &shape;
    if (!shape.isShared()) return add(shape.keys, depth);
    KnownShape& known = knownShapes_[reinterpret_cast<std::uintptr_t>(&shape) / 64 % knownShapes_.size()];
    if (known.shape != &shape) known = {&shape, textOfKeys(shape)};
    text += known.text;
  }
  static std::size_t textOfKeys(const Shape& shape) noexcept {
    std::size_t size = 0;
    for (const Value& key : shape.keys)
      size += Internals::isInline(key) ? 0 : textSize(key);
    return size;
  }

  struct KnownShape {
    const Shape* shape = nullptr;
    std::size_t text = 0;
  };
  const Shape* latestShape_ = nullptr;
  std::array<KnownShape, 16> knownShapes_;
};

class BinaryWriter {
 public:
  Result<Bytes> write(const Value& root);

 private:
  bool writeObjects(const Value& root, const Measure& measure);
  std::uint32_t writeValue(const Value& value) {
    return Internals::isContainer(value) ? writeContainer(value) : writeScalar(value);
  }
  std::uint32_t writeScalar(const Value& value);
  std::uint32_t writeOnce(const Value& scalar);
  std::uint32_t writeLong(const Value& scalar);
  std::byte* encode(const Value& value, std::byte* at);
  std::byte* encodeString(std::string_view text, std::byte* at);
  std::uint32_t writeContainer(const Value& value);
  std::uint32_t writeReferences(Marker marker, ByteView keys, std::size_t first);
  void writeValues(std::span<const Value> values);
  ByteView referencesToKeys(const Shape& shape);
  void writeEnd();

  std::byte* reserve(std::size_t size) {
    if (out_.size() - end_ < size + kMargin) grow(size + kMargin);
    return out_.data() + end_;
  }
  void grow(std::size_t size);
  void advanceTo(const std::byte* end) noexcept { end_ = static_cast<std::size_t>(end - out_.data()); }
  std::byte* fail(Failure kind, std::string_view what) {
    if (!failure_) failure_ = failure(kind, what);
    limit_ = 0;
    return nullptr;
  }

  Bytes out_;
  std::size_t end_ = 0;
  ObjectTable objects_;
  /// The numbers of the long scalars, by their storage.
  std::unordered_map<const Payload*, std::uint32_t> longScalars_;
  unsigned referenceSize_ = 1;
  /// Writing stops at an object of this number, which no reference can hold. 0 after a failure.
  std::uint64_t limit_ = 0;
  /// Numbers of the elements and values of the open containers, innermost last.
  std::vector<std::uint32_t> open_;

  /// The references to a shape's keys in the document, at `start` in `keyReferences_`.
  struct KnownShape {
    const Shape* shape = nullptr;
    std::size_t start = 0;
  };
  std::array<KnownShape, 64> knownShapes_;
  Bytes keyReferences_;
  std::optional<Error> failure_;
};

Result<Bytes> BinaryWriter::write(const Value& root) {
  Measure measure;
  measure.add({&root, 1}, 0);
  if (measure.isTooDeep) return failure(Failure::tooDeep, "Containers are nested too deep");
  if (measure.values > kMaximumValues) return failure(Failure::tooLarge, "Too many values for one property list");
  out_.resize(std::min(measure.bytes + 2 * kMargin, kLargestAtFirst));
  // There are at least as many objects as containers.
  referenceSize_ = bytesFor(measure.containers);
  while (!writeObjects(root, measure))
    referenceSize_ *= 2;
  if (failure_) return *std::move(failure_);
  writeEnd();
  if (end_ > kMaximumDocumentSize) return failure(Failure::tooLarge, "Too much content for one property list");
  // Readers also count short text, which is at most 30 bytes for each byte of the document.
  if (measure.text > kMaximumExpandedSize + 2 * end_) {
    return failure(Failure::tooLarge, "Too much text for one property list");
  }
  return std::move(out_);
}

/// Returns false if there are too many objects for references of referenceSize_ bytes.
bool BinaryWriter::writeObjects(const Value& root, const Measure& measure) {
  limit_ = std::uint64_t{1} << (8 * referenceSize_);
  end_ = 0;
  objects_.clear(measure.values);
  longScalars_.clear();
  open_.clear();
  keyReferences_.clear();
  knownShapes_.fill({});
  advanceTo(writeBytes(kMagic, reserve(kMagic.size())));
  writeValue(root);
  return failure_ || bytesFor(objects_.size()) <= referenceSize_;
}

void BinaryWriter::grow(std::size_t size) {
  if (out_.size() + size > kMaximumDocumentSize) fail(Failure::tooLarge, "Too much content for one property list");
  out_.resize((out_.size() + size) * 2);
}

/// Writes a scalar unless an equal one exists. Returns its number.
inline std::uint32_t BinaryWriter::writeOnce(const Value& scalar) {
  const std::size_t before = objects_.size();
  const std::uint32_t number = objects_.findOrAdd(scalar, end_);
  if (number != before) return number;
  if (const std::byte* end = encode(scalar, reserve(0))) advanceTo(end);
  return number;
}

std::uint32_t BinaryWriter::writeScalar(const Value& value) {
  if (!Internals::isInline(value) && Internals::text(value).size() >= kLongScalar) return writeLong(value);
  return writeOnce(value);
}

std::uint32_t BinaryWriter::writeLong(const Value& scalar) {
  const auto [known, isNew] = longScalars_.try_emplace(Internals::shared(scalar), 0);
  if (isNew) known->second = writeOnce(scalar);
  return known->second;
}

/// Writes a scalar. The buffer has space for everything but text and data. Returns the end, or null on failure.
std::byte* BinaryWriter::encode(const Value& value, std::byte* at) {
  switch (value.type()) {
    case Type::boolean:
      return writeMarker(Marker::boolean, *value.boolean() ? kTrue : kFalse, at);
    case Type::integer:
      return writeInteger(value, at);
    case Type::real:
      return writeDouble(Marker::real, *value.number(), at);
    case Type::date:
      if (!isInCalendar(*value.date())) return fail(Failure::notRepresentable, "A date outside the calendar");
      return writeDouble(Marker::date, value.date()->seconds, at);
    case Type::uid:
      return writeUid(*value.uid(), at);
    case Type::data:
      at = reserve(Internals::text(value).size());
      return writeBytes(Internals::text(value), writeHead(Marker::data, Internals::text(value).size(), at));
    case Type::string:
      return isShortASCII(value) ? writeShortASCII(value, at) : encodeString(Internals::text(value), at);
    default:
      return fail(Failure::notRepresentable, "A property list cannot hold a null");
  }
}

std::byte* BinaryWriter::encodeString(std::string_view text, std::byte* at) {
  if (isASCII(text)) return writeBytes(text, writeHead(Marker::ascii, text.size(), reserve(text.size())));
  at = reserve(2 * text.size());
  // The length is known afterwards: at most that of the UTF-8, and so is the size of its head.
  std::byte* const draft = writeHead(Marker::utf16, text.size(), at);
  std::byte* const end = writeUTF16(text, draft);
  if (end == nullptr) return fail(Failure::badText, "A string is not well-formed UTF-8");
  const auto size = static_cast<std::size_t>(end - draft);
  std::byte* const start = writeHead(Marker::utf16, size / 2, at);
  if (start != draft) std::memmove(start, draft, size);
  return start + size;
}

std::uint32_t BinaryWriter::writeContainer(const Value& value) {
  const std::size_t first = open_.size();
  if (const Array* array = value.array()) {
    writeValues(*array);
    return writeReferences(Marker::array, {}, first);
  }
  DictionaryPayload* payload = Internals::payload(*value.dictionary());
  if (payload == nullptr || payload->count == 0) return writeReferences(Marker::dictionary, {}, first);
  writeValues({payload->values(), payload->count});
  return writeReferences(Marker::dictionary, referencesToKeys(*payload->shape), first);
}

/// Writes values and appends their numbers to `open_`.
void BinaryWriter::writeValues(std::span<const Value> values) {
  for (const Value& value : values) {
    const std::uint32_t number = writeValue(value);
    open_.push_back(number);
    if (number >= limit_) return;
  }
}

/// Writes a container of the numbers in `open_` from `first` on, and removes them there.
std::uint32_t BinaryWriter::writeReferences(Marker marker, ByteView keys, std::size_t first) {
  const std::span<const std::uint32_t> numbers = std::span(open_).subspan(first);
  std::byte* at = reserve(keys.size() + numbers.size() * referenceSize_);
  const std::size_t start = end_;
  at = writeHead(marker, numbers.size(), at);
  at = writeBytes(textOf(keys), at);
  advanceTo(writeNumbers(numbers, referenceSize_, at));
  open_.resize(first);
  return objects_.add(start);
}

ByteView BinaryWriter::referencesToKeys(const Shape& shape) {
  const std::size_t size = shape.keys.size() * referenceSize_;
  KnownShape& known = knownShapes_[reinterpret_cast<std::uintptr_t>(&shape) / 64 % knownShapes_.size()];
  if (known.shape != &shape) {
    known = {&shape, keyReferences_.size()};
    keyReferences_.resize(known.start + size);
    std::byte* at = keyReferences_.data() + known.start;
    for (const Value& key : shape.keys)
      at = storeBigEndian(writeScalar(key), referenceSize_, at);
  }
  return ByteView(keyReferences_).subspan(known.start, size);
}

void BinaryWriter::writeEnd() {
  const std::size_t table = end_;
  const unsigned offsetSize = bytesFor(table);
  std::byte* at = reserve(objects_.size() * offsetSize);
  at = writeNumbers(objects_.offsets(), offsetSize, at);
  at = storeBigEndian(offsetSize, 7, at);
  at = storeBigEndian(referenceSize_, 1, at);
  at = storeBigEndian(objects_.size(), 8, at);
  at = storeBigEndian(objects_.size() - 1, 8, at);
  advanceTo(storeBigEndian(table, 8, at));
  out_.resize(end_);
}

}  // namespace

Result<Bytes> writeBinary(const Value& root) {
  return BinaryWriter().write(root);
}

}  // namespace appsync::plist
