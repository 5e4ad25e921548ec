// Reads the binary form: numbered objects, a table of where each lies, and a trailer that says how to read the table.
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

/// The limits of the expansion of a document of `size` bytes. Repeated objects share their storage, so that memory
/// stays in proportion to the size in any case; the limits protect callers that visit each value or copy each text.
/// Data is not limited: callers use it in place. Documents that store each container once never reach the limit of
/// values, because every reference takes at least a byte.
constexpr Expansion mostExpanded(std::uint64_t size) noexcept {
  return {32 * size + 262144, 32 * size + kMaximumExpandedSize};
}

/// Numbers of objects, a bit for each.
class ObjectBitset {
 public:
  void resize(std::uint64_t count) { words_.resize(static_cast<std::size_t>(count / 64 + 1)); }
  /// False when it was there.
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
  /// What is read may keep the document.
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

  // One by one, for a root that is a dictionary.

  /// False when it is none or cannot be read; `read` tells which.
  [[nodiscard]] bool beginEntries();
  /// Reads all entries once. Their places, in the order of their keys, without those that a later one replaces.
  [[nodiscard]] Result<std::vector<std::size_t>> checkEntries();
  /// What follows reads them once more.
  void startAgain() noexcept { expansion_ = {}; }
  // Null when it cannot be read.
  [[nodiscard]] Value entryKey(std::size_t place);
  [[nodiscard]] Value entryValue(std::size_t place);

 private:
  /// Where an object's content lies and how many bytes or elements it has.
  struct Extent {
    std::size_t start;
    std::uint64_t count;
  };

  /// Long or nested content that was met a second time and is shared from then on.
  struct Shared {
    Value value;
    Expansion expansion;
  };

  /// The keys of a dictionary met before, told by the bytes of its references to them.
  struct KnownKeys {
    const std::byte* references = nullptr;
    std::size_t size = 0;
    DictionaryPool pool;
    /// For each key as written, its place in the shape. Null when they are in order.
    std::shared_ptr<const std::vector<std::uint32_t>> places;
  };

  Value fail(Failure kind, std::string_view what, std::size_t at);
  void failMissing(std::uint64_t number);

  void readTrailer();
  /// Where an object begins.
  bool locate(std::uint64_t number, std::size_t& at);
  void sortByKey(std::vector<std::size_t>& places);
  void forgetWhatWasShared();
  // Each reads an object into `place`, which holds a null; a null that stays means failure.
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
  bool learnKeys(KnownKeys& known, Extent extent, int depth);

  bool readExtent(std::size_t at, unsigned low, Extent& extent) {
    extent = {at + 1, low};
    return low != 0xF || readLongExtent(at, extent);
  }
  bool readLongExtent(std::size_t at, Extent& extent);
  bool fits(std::size_t at, const Extent& extent, std::uint64_t bytesEach) {
    // A count of no more than the document's bytes cannot overflow.
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
    fail(Failure::tooLarge, "Far more values or text than the document's size accounts for, met", at);
    return false;
  }
  [[nodiscard]] std::uint64_t reference(std::size_t at) const noexcept {
    return loadBigEndian(begin_ + at, referenceSize_);
  }
  [[nodiscard]] bool wasSeen(std::uint64_t number);

  const std::byte* begin_;
  std::size_t size_;
  /// Null when nothing may keep it.
  std::shared_ptr<const Bytes> document_;
  unsigned offsetSize_ = 0;
  unsigned referenceSize_ = 0;
  std::uint64_t objectCount_ = 0;
  std::uint64_t top_ = 0;
  /// The end of the objects and start of the table.
  std::size_t table_ = 0;

  Expansion expansion_;
  /// The long or nested objects that were ever met, and how many bytes of content they have.
  ObjectBitset measured_;
  std::uint64_t content_ = 0;
  /// Those that were met and not forgotten.
  ObjectBitset seen_;
  std::unordered_map<std::uint64_t, Shared> shared_;
  /// Whether what was met is forgotten from one entry to the next, and what there is to forget.
  bool forgets_ = false;
  std::vector<std::uint64_t> met_;
  /// The root's, when they are read one by one.
  Extent entries_{};
  std::array<KnownKeys, 32> knownKeys_;
  /// Text that had to be converted.
  std::string text_;
  std::optional<Error> failure_;
};

}  // namespace appsync::plist
