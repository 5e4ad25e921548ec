// The storage of values: counted payloads, shapes of dictionaries, and the access that readers and writers need.
#pragma once

#include <array>
#include <atomic>
#include <cstddef>
#include <cstdint>
#include <memory>
#include <span>
#include <string_view>
#include <utility>
#include <vector>

#include "plist/Value.h"

namespace appsync::plist {

/// Reference-counted content, freed by its last owner. Immutable while it has more than one owner.
struct Payload {
  std::atomic<std::uint32_t> owners{1};

  void retain(std::uint32_t times = 1) noexcept { owners.fetch_add(times, std::memory_order_relaxed); }
  /// Returns true for the last owner.
  [[nodiscard]] bool release(std::uint32_t times = 1) noexcept {
    // Most payloads have one owner only; no other thread can become an owner concurrently.
    return owners.load(std::memory_order_acquire) == times ||
           owners.fetch_sub(times, std::memory_order_acq_rel) == times;
  }
  [[nodiscard]] bool isShared() const noexcept { return owners.load(std::memory_order_acquire) != 1; }
};

/// A long string, directly followed by its bytes in memory.
struct TextPayload : Payload {
  std::size_t size = 0;

  [[nodiscard]] char* bytes() noexcept { return reinterpret_cast<char*>(this + 1); }
  [[nodiscard]] static TextPayload* make(std::size_t size);
  static void destroy(TextPayload* text) noexcept;
};

/// Owned bytes, or a part of a document that it keeps alive.
struct DataPayload : Payload {
  explicit DataPayload(Bytes content) noexcept : own(std::move(content)), bytes(own) {}
  DataPayload(std::shared_ptr<const Bytes> whole, ByteView part) noexcept : document(std::move(whole)), bytes(part) {}

  const Bytes own;
  const std::shared_ptr<const Bytes> document;
  const ByteView bytes;
};

/// Content that contains values. `destroyLater` bounds the recursion of the destruction of nested containers.
struct Container : Payload {
  enum class Kind : std::uint8_t { array, dictionary };
  explicit Container(Kind which) noexcept : kind(which) {}

  Kind kind;
  Container* nextToDestroy = nullptr;

  /// Releases one ownership.
  static void drop(Container* container) noexcept {
    if (container->release()) destroyLater(container);
  }

 private:
  static void destroyLater(Container* container) noexcept;
  static void destroy(Container* container) noexcept;
};

struct ArrayPayload : Container {
  explicit ArrayPayload(Array content) noexcept : Container(Kind::array), elements(std::move(content)) {}
  Array elements;
};

/// The sorted keys of one or more dictionaries. A document often has thousands of dictionaries with the same keys: they
/// share one shape, so that each stores values only, and writers recognise repeated keys.
struct Shape : Payload {
  std::vector<Value> keys;

  static void drop(Shape* shape, std::uint32_t times = 1) noexcept {
    if (shape->release(times)) delete shape;
  }
};

/// Memory for several dictionaries, which directly follows it. Freed with the last of them.
struct alignas(std::max_align_t) Slab : Payload {
  [[nodiscard]] std::byte* memory() noexcept { return reinterpret_cast<std::byte*>(this + 1); }
  /// With `owners` owners.
  [[nodiscard]] static Slab* make(std::size_t bytes, std::uint32_t owners);
  static void drop(Slab* slab, std::uint32_t times = 1) noexcept;
};

/// A dictionary, directly followed in memory by its values, which are parallel to the keys of its shape.
struct DictionaryPayload : Container {
  DictionaryPayload(Shape* keys, std::uint32_t room) noexcept
      : Container(Kind::dictionary), capacity(room), shape(keys) {}

  std::uint32_t capacity;
  std::uint32_t count = 0;
  Shape* shape;
  /// The slab that its memory belongs to, or null if it was allocated separately.
  Slab* slab = nullptr;

  [[nodiscard]] Value* values() noexcept { return std::launder(reinterpret_cast<Value*>(this + 1)); }
  /// Allocates memory for `capacity` values and constructs none. Takes over one ownership of `shape`.
  [[nodiscard]] static DictionaryPayload* make(Shape* shape, std::size_t capacity);
  static void destroy(DictionaryPayload* dictionary) noexcept;
};

/// Allocates dictionaries of one shape. A document with one such dictionary often has thousands: memory and ownerships
/// of the shape are acquired for several at a time. A default-constructed pool allocates none.
class DictionaryPool {
 public:
  DictionaryPool() noexcept = default;
  explicit DictionaryPool(Shape& shape) noexcept : shape_(&shape) { shape.retain(); }
  DictionaryPool(DictionaryPool&& other) noexcept { *this = std::move(other); }
  DictionaryPool& operator=(DictionaryPool&& other) noexcept {
    std::swap(shape_, other.shape_);
    std::swap(slab_, other.slab_);
    std::swap(next_, other.next_);
    std::swap(left_, other.left_);
    std::swap(atOnce_, other.atOnce_);
    return *this;
  }
  ~DictionaryPool();

  /// Returns a dictionary of nulls, which the caller replaces in its payload.
  [[nodiscard]] Dictionary make();
  [[nodiscard]] Shape& operator*() const noexcept { return *shape_; }
  [[nodiscard]] Shape* operator->() const noexcept { return shape_; }

 private:
  void refill(std::size_t bytesEach);

  Shape* shape_ = nullptr;
  Slab* slab_ = nullptr;
  std::byte* next_ = nullptr;
  std::uint32_t left_ = 0;
  std::uint32_t atOnce_ = 1;
};

/// Access to the representation of values, for readers and writers.
struct Internals {
  using Words = std::array<std::uint64_t, sizeof(Value) / sizeof(std::uint64_t)>;

  [[nodiscard]] static DictionaryPayload* payload(const Dictionary& dictionary) noexcept { return dictionary.payload_; }
  /// Takes over one ownership of `payload`, whose values must be complete.
  [[nodiscard]] static Dictionary adopt(DictionaryPayload* payload) noexcept {
    Dictionary dictionary;
    dictionary.payload_ = payload;
    return dictionary;
  }
  /// The bytes of a string or data.
  [[nodiscard]] static std::string_view text(const Value& value) noexcept { return value.text(); }
  [[nodiscard]] static bool isInline(const Value& value) noexcept { return value.bits_.length != Value::kShared; }
  /// The size of a string or data that is stored inline.
  [[nodiscard]] static std::size_t inlineSize(const Value& value) noexcept { return value.bits_.length; }
  [[nodiscard]] static bool isContainer(const Value& value) noexcept { return value.bits_.type >= Type::array; }
  /// Sets a null to a string that is stored inline. Unused bytes of `words` must be zero.
  static void setShortString(Value& null, const Words& words, std::size_t size) noexcept {
    std::memcpy(static_cast<void*>(&null.bits_), words.data(), sizeof null.bits_);
    null.bits_.length = static_cast<std::uint8_t>(size);
    null.bits_.type = Type::string;
  }
  /// Returns data that refers to `part` of `document` and keeps the document alive.
  [[nodiscard]] static Value dataIn(std::shared_ptr<const Bytes> document, ByteView part) {
    Value data;
    data.store<Payload*>(Type::data, new DataPayload(std::move(document), part), Value::kShared);
    return data;
  }
  static constexpr std::size_t kInlineCapacity = Value::kInlineCapacity;
  [[nodiscard]] static const void* bits(const Value& value) noexcept { return &value.bits_; }
  /// Returns the representation as numbers, loaded one at a time to avoid a copy through memory.
  [[nodiscard]] static Words words(const Value& value) noexcept {
    const auto word = [&value](std::size_t i) {
      std::uint64_t number;
      std::memcpy(&number, reinterpret_cast<const std::byte*>(&value.bits_) + i * sizeof number, sizeof number);
      return number;
    };
    return {word(0), word(1), word(2), word(3)};
  }
  [[nodiscard]] static Payload* shared(const Value& value) noexcept { return value.load<Payload*>(); }
};

/// Builds a dictionary of keys and values in any order; of equal keys the last one wins. Moves from the values.
[[nodiscard]] Dictionary makeDictionary(std::span<const Value> keys, std::span<Value> values);

/// Builds a dictionary of values in the order of the keys that `places` was computed for. Moves from the values.
[[nodiscard]] Dictionary makeDictionary(DictionaryPool& pool, std::span<const std::uint32_t> places,
                                        std::span<Value> values);

/// Returns for each key its index in the shape, or an empty list if the keys are sorted.
[[nodiscard]] std::vector<std::uint32_t> placesOf(std::span<const Value> keys, const Shape& shape);

}  // namespace appsync::plist
