// Reads the binary format; see BinaryFormat.h.
#pragma once

#include <array>
#include <cstdint>
#include <memory>
#include <optional>
#include <string>
#include <string_view>
#include <unordered_map>
#include <utility>
#include <vector>

#include "plist/internal/BigEndian.h"
#include "plist/internal/BinaryFormat.h"
#include "plist/internal/Failure.h"
#include "plist/internal/Storage.h"

namespace appsync::plist {

/// How far a document expands through objects that are referenced repeatedly: the values of its tree, and the bytes of
/// long text, both counted at each reference.
struct Expansion {
  std::uint64_t values = 0;
  std::uint64_t text = 0;

  Expansion& operator+=(const Expansion& other) noexcept {
    values += other.values;
    text += other.text;
    return *this;
  }
  Expansion operator-(const Expansion& other) const noexcept { return {values - other.values, text - other.text}; }
};

/// Returns the expansion limits of a document of `size` bytes. Repeated objects share their storage, so that memory is
/// proportional to the size in any case; the limits protect callers that visit each value or copy each text. Data is
/// not limited: callers use it in place.
constexpr Expansion mostExpanded(std::uint64_t size) noexcept {
  return {kExpansionPerByte * size + kExpansionAllowance, kExpansionPerByte * size + kMaximumExpandedSize};
}

/// A set of object numbers, one bit for each.
class ObjectBitset {
 public:
  void resize(std::uint64_t count) { words_.resize(static_cast<std::size_t>(count / 64 + 1)); }
  /// Returns false if `number` is in the set already.
  bool insert(std::uint64_t number) {
    std::uint64_t& word = words_[static_cast<std::size_t>(number / 64)];
    const std::uint64_t before = word;
    word |= bitOf(number);
    return word != before;
  }
  void erase(std::uint64_t number) { words_[static_cast<std::size_t>(number / 64)] &= ~bitOf(number); }

 private:
  [[nodiscard]] static std::uint64_t bitOf(std::uint64_t number) { return std::uint64_t{1} << number % 64; }

  std::vector<std::uint64_t> words_;
};

/// Reads one document.
class BinaryReader {
 public:
  explicit BinaryReader(ByteView document) noexcept : begin_(document.data()), size_(document.size()) {}
  /// Long data that is read keeps the document alive.
  explicit BinaryReader(std::shared_ptr<const Bytes> document) noexcept : BinaryReader(ByteView(*document)) {
    document_ = std::move(document);
  }

  Result<Value> read() {
    readTrailer();
    Value root;
    if (!failure_) readObject(top_, 0, root);
    if (failure_) return *std::move(failure_);
    return root;
  }

  // For a root that is a dictionary: one entry at a time.

  /// Returns false if the root is not a dictionary or the document is invalid; `read` then returns the error.
  [[nodiscard]] bool beginEntries();
  /// Reads all entries once for validation. Returns their indices, sorted by key; of equal keys only the last one.
  [[nodiscard]] Result<std::vector<std::size_t>> checkEntries();
  /// Resets the expansion count, before the entries are read again.
  void startAgain() noexcept { expansion_ = {}; }
  // Each returns a null if the entry cannot be read.
  [[nodiscard]] Value entryKey(std::size_t place);
  [[nodiscard]] Value entryValue(std::size_t place);

 private:
  /// The offset of an object's content, and its number of bytes or elements.
  struct Extent {
    std::size_t start;
    std::uint64_t count;
  };

  /// A variable-length object that was read for the second time: further references share its value.
  struct Shared {
    Value value;
    Expansion expansion;
  };

  /// The keys of a dictionary, cached under the bytes of its references to them.
  struct KnownKeys {
    const std::byte* references = nullptr;
    std::size_t size = 0;
    DictionaryPool pool;
    /// For each key in document order its index in the shape. Null if they are sorted.
    std::shared_ptr<const std::vector<std::uint32_t>> places;
  };

  Value fail(Failure kind, std::string_view what, std::size_t at);
  void failMissing(std::uint64_t number);

  void readTrailer();
  /// Sets `at` to the offset of an object. Returns false if the object does not exist.
  bool locate(std::uint64_t number, std::size_t& at);
  void sortByKey(std::vector<std::size_t>& places);
  void forgetShared();
  // Each reads an object into `place`, which holds a null, and leaves the null on failure.
  void readObject(std::uint64_t number, int depth, Value& place);
  void readOther(std::uint64_t number, std::size_t at, int depth, Value& place);
  bool readShortASCII(std::size_t start, std::size_t size, Value& place);
  bool readShortUTF16(std::size_t start, std::size_t count, Value& place);
  void readLong(std::uint64_t number, std::size_t at, unsigned marker, int depth, Value& place);
  void readContent(std::uint64_t number, std::size_t at, unsigned marker, int depth, Value& place);
  void readArray(std::size_t at, Extent extent, int depth, Value& place);
  void readDictionary(std::size_t at, Extent extent, int depth, Value& place);
  void readRepeatingDictionary(Extent extent, int depth, Value& place);
  [[nodiscard]] Value readData(ByteView bytes) const;
  Value readInteger(std::size_t at, unsigned exponent);
  Value readReal(std::size_t at, unsigned exponent);
  Value readDate(std::size_t at, unsigned low);
  Value readUid(std::size_t at, unsigned size);
  Value readASCII(std::size_t at, Extent extent);
  Value readUTF16(Extent extent);
  KnownKeys* keysOf(Extent extent, int depth);
  bool readKeys(KnownKeys& known, Extent extent, int depth);

  bool readExtent(std::size_t at, unsigned low, Extent& extent) {
    extent = {at + 1, low};
    return low != kLongCount || readLongExtent(at, extent);
  }
  bool readLongExtent(std::size_t at, Extent& extent);
  bool fits(std::size_t at, const Extent& extent, std::uint64_t bytesEach) {
    // The product cannot overflow: the count is at most the size of the document.
    if (extent.start <= table_ && extent.count <= table_ && extent.count * bytesEach <= table_ - extent.start)
      return true;
    fail(Failure::outOfRange, "An object longer than the document", at);
    return false;
  }
  bool checkOverlap(std::uint64_t number, std::size_t at, std::uint64_t bytes);
  /// Returns false if the document expands beyond the limits.
  bool expand(const Expansion& more, std::size_t at) {
    expansion_ += more;
    const Expansion most = mostExpanded(size_);
    if (expansion_.values <= most.values && expansion_.text <= most.text) return true;
    fail(Failure::tooLarge, "Shared content that expands too far, detected", at);
    return false;
  }
  [[nodiscard]] std::uint64_t reference(std::size_t at) const noexcept {
    return loadBigEndian(begin_ + at, referenceSize_);
  }
  /// Marks an object as read. Returns whether it was read before.
  [[nodiscard]] bool isRepeated(std::uint64_t number);

  const std::byte* begin_;
  std::size_t size_;
  /// Null if values must not keep the document.
  std::shared_ptr<const Bytes> document_;
  unsigned offsetSize_ = 0;
  unsigned referenceSize_ = 0;
  std::uint64_t objectCount_ = 0;
  std::uint64_t top_ = 0;
  /// The end of the objects and start of the table.
  std::size_t table_ = 0;

  Expansion expansion_;
  /// The variable-length objects that were read, and the size of their content.
  ObjectBitset measured_;
  std::uint64_t content_ = 0;
  /// The variable-length objects that were read in this document, or in this entry if forgetsEntries_.
  ObjectBitset seen_;
  std::unordered_map<std::uint64_t, Shared> shared_;
  /// Whether seen_ and shared_ are cleared between entries, and the objects in seen_.
  bool forgetsEntries_ = false;
  std::vector<std::uint64_t> seenInEntry_;
  /// The references of the root, if entries are read one at a time.
  Extent entries_{};
  std::array<KnownKeys, 32> knownKeys_;
  /// Buffer for converted text.
  std::string text_;
  std::optional<Error> failure_;
};

}  // namespace appsync::plist
