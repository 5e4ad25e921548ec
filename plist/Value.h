// A property list in memory: one value, and the dictionary.
#pragma once

#include <compare>
#include <concepts>
#include <cstdint>
#include <cstring>
#include <initializer_list>
#include <iterator>
#include <new>
#include <optional>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

#include "base/Bytes.h"

namespace appsync::plist {

class Value;
using Array = std::vector<Value>;

enum class Type : std::uint8_t { null, boolean, integer, real, string, data, date, uid, array, dictionary };

/// A point in time, in seconds since 2001-01-01 00:00:00 UTC.
struct Date {
  double seconds = 0;
  auto operator<=>(const Date&) const = default;
};

/// A keyed archive's reference to another of its objects.
struct Uid {
  std::uint64_t number = 0;
  auto operator<=>(const Uid&) const = default;
};

/// Unique string keys, each with a value, in the order of the keys' bytes.
///
/// Copy-on-write. Different copies may be used on different threads.
/// Pointers to values are valid until the dictionary is changed or copied.
class Dictionary {
 public:
  struct Entry {
    std::string_view key;
    const Value& value;
  };

  /// Iterates over the entries. `*iterator` is an Entry by value: `for (const auto& [key, value] : dictionary)`.
  class Iterator {
   public:
    using iterator_category = std::input_iterator_tag;
    using value_type = Entry;
    using difference_type = std::ptrdiff_t;
    using pointer = void;
    using reference = Entry;

    Iterator() = default;
    Iterator(const Value* key, const Value* value) noexcept : key_(key), value_(value) {}
    inline Entry operator*() const noexcept;
    inline Iterator& operator++() noexcept;
    inline Iterator operator++(int) noexcept;
    bool operator==(const Iterator& other) const noexcept { return value_ == other.value_; }

   private:
    const Value* key_ = nullptr;
    const Value* value_ = nullptr;
  };

  Dictionary() noexcept = default;
  /// Of equal keys the last one counts.
  Dictionary(std::initializer_list<std::pair<std::string_view, Value>> entries);
  Dictionary(const Dictionary& other) noexcept;
  Dictionary(Dictionary&& other) noexcept : payload_(std::exchange(other.payload_, nullptr)) {}
  Dictionary& operator=(Dictionary other) noexcept {
    std::swap(payload_, other.payload_);
    return *this;
  }
  ~Dictionary();

  /// Returns the value under `key`, or null if there is no such key.
  [[nodiscard]] const Value* find(std::string_view key) const noexcept;
  [[nodiscard]] Value* find(std::string_view key);
  [[nodiscard]] bool contains(std::string_view key) const noexcept { return find(key) != nullptr; }

  /// Sets the value under `key`, replacing an existing one. Fastest if keys are set in ascending order.
  void set(std::string_view key, Value value);
  /// Returns false if there is no such key.
  bool erase(std::string_view key);

  [[nodiscard]] std::size_t size() const noexcept;
  [[nodiscard]] bool empty() const noexcept { return size() == 0; }
  [[nodiscard]] Iterator begin() const noexcept;
  [[nodiscard]] Iterator end() const noexcept;

  bool operator==(const Dictionary& other) const;

 private:
  friend struct Internals;
  struct DictionaryPayload* payload_ = nullptr;
};

/// Any property-list value, or null.
///
/// Copy-on-write: a copy costs a reference count and behaves like a deep copy. Different copies may be used on
/// different threads. Values of any nesting depth can be destroyed, compared and described.
/// The results of `array()`, `dictionary()`, `string()` and `data()` are valid until this value is changed or
/// destroyed; a mutable result must not be written through after this value is copied.
class Value {
 public:
  Value() noexcept = default;
  Value(std::nullptr_t) noexcept {}
  template <std::same_as<bool> T>
  Value(T truth) noexcept {
    bits_.type = Type::boolean;
    bits_.length = truth ? 1 : 0;
  }
  template <std::integral T>
  requires(!std::same_as<T, bool>) Value(T number)
  noexcept {
    const bool aboveSigned = std::in_range<std::uint64_t>(number) && !std::in_range<std::int64_t>(number);
    store(Type::integer, static_cast<std::uint64_t>(number), aboveSigned ? kAboveSigned : std::uint8_t{0});
  }
  template <std::floating_point T>
  Value(T number) noexcept {
    store(Type::real, static_cast<double>(number));
  }
  Value(const char* text) : Value(std::string_view(text)) {}
  Value(std::string_view text) : Value(Type::string, text) {}
  Value(const std::string& text) : Value(Type::string, text) {}
  /// Data. Takes over the buffer, without a copy unless it is tiny.
  Value(Bytes bytes);
  Value(Date date) noexcept { store(Type::date, date.seconds); }
  Value(Uid uid) noexcept { store(Type::uid, uid.number); }
  Value(Array elements);
  Value(Dictionary dictionary) noexcept {
    bits_.type = Type::dictionary;
    bits_.length = kShared;
    ::new (static_cast<void*>(bits_.storage)) Dictionary(std::move(dictionary));
  }
  /// Data, as a copy of `bytes`.
  [[nodiscard]] static Value data(ByteView bytes) { return {Type::data, textOf(bytes)}; }

  Value(const Value& other) noexcept : bits_(other.bits_) {
    if (bits_.length == kShared) retain();
  }
  Value(Value&& other) noexcept : bits_(std::exchange(other.bits_, Bits{})) {}
  Value& operator=(const Value& other) noexcept {
    Value copy(other);
    std::swap(bits_, copy.bits_);
    return *this;
  }
  Value& operator=(Value&& other) noexcept {
    Value taken(std::move(other));
    std::swap(bits_, taken.bits_);
    return *this;
  }
  ~Value() {
    if (bits_.length == kShared) release();
  }

  [[nodiscard]] Type type() const noexcept { return bits_.type; }
  [[nodiscard]] bool isNull() const noexcept { return bits_.type == Type::null; }

  // Each returns nullopt or null if the value has another type. Only numbers are converted, and only if they fit.
  [[nodiscard]] std::optional<bool> boolean() const noexcept;
  [[nodiscard]] std::optional<std::int64_t> int64() const noexcept;
  [[nodiscard]] std::optional<std::uint64_t> uint64() const noexcept;
  /// A real, or an integer rounded to the nearest double.
  [[nodiscard]] std::optional<double> number() const noexcept;
  [[nodiscard]] std::optional<std::string_view> string() const noexcept {
    if (bits_.type != Type::string) return std::nullopt;
    return text();
  }
  [[nodiscard]] std::optional<ByteView> data() const noexcept;
  [[nodiscard]] std::optional<Date> date() const noexcept;
  [[nodiscard]] std::optional<Uid> uid() const noexcept;
  [[nodiscard]] const Array* array() const noexcept;
  [[nodiscard]] Array* array();
  [[nodiscard]] const Dictionary* dictionary() const noexcept {
    return bits_.type == Type::dictionary ? std::launder(reinterpret_cast<const Dictionary*>(bits_.storage)) : nullptr;
  }
  [[nodiscard]] Dictionary* dictionary() noexcept {
    return bits_.type == Type::dictionary ? std::launder(reinterpret_cast<Dictionary*>(bits_.storage)) : nullptr;
  }

  /// Returns the value under `key`, or null if this is not a dictionary or has no such key.
  [[nodiscard]] const Value* find(std::string_view key) const noexcept {
    const Dictionary* held = dictionary();
    return held == nullptr ? nullptr : held->find(key);
  }

  /// Whether type and content are equal. An integer never equals a real. A NaN equals a NaN, unlike in arithmetic,
  /// so that a document always equals its copy.
  bool operator==(const Value& other) const;

 private:
  friend struct Internals;
  friend class Dictionary;

  static constexpr std::size_t kInlineCapacity = 30;
  /// `length` of a value whose storage holds a pointer to a counted payload (for a dictionary, possibly null).
  static constexpr std::uint8_t kShared = 0xFF;
  /// `length` of an integer above the signed range.
  static constexpr std::uint8_t kAboveSigned = 1;

  /// Unused storage is always zero: scalars can be hashed and compared as 32 bytes.
  struct Bits {
    alignas(8) std::byte storage[kInlineCapacity] = {};
    std::uint8_t length = 0;
    Type type = Type::null;
  };

  Value(Type type, std::string_view bytes) {
    bits_.type = type;
    if (bytes.size() > kInlineCapacity) {
      storeLong(bytes);
    } else if (!bytes.empty()) {
      bits_.length = static_cast<std::uint8_t>(bytes.size());
      std::memcpy(bits_.storage, bytes.data(), bytes.size());
    }
  }
  template <class T>
  void store(Type type, T content, std::uint8_t length = 0) noexcept {
    bits_.type = type;
    bits_.length = length;
    std::memcpy(bits_.storage, &content, sizeof content);
  }
  template <class T>
  [[nodiscard]] T load() const noexcept {
    T content;
    std::memcpy(&content, bits_.storage, sizeof content);
    return content;
  }
  void storeLong(std::string_view bytes);
  /// Only for a string or data.
  [[nodiscard]] std::string_view text() const noexcept {
    return bits_.length == kShared ? longText()
                                   : std::string_view(reinterpret_cast<const char*>(bits_.storage), bits_.length);
  }
  [[nodiscard]] std::string_view longText() const noexcept;
  void retain() const noexcept;
  void release() noexcept;

  Bits bits_;
};

inline Dictionary::Entry Dictionary::Iterator::operator*() const noexcept {
  return {*key_->string(), *value_};
}

inline Dictionary::Iterator& Dictionary::Iterator::operator++() noexcept {
  ++key_;
  ++value_;
  return *this;
}

inline Dictionary::Iterator Dictionary::Iterator::operator++(int) noexcept {
  Iterator before = *this;
  ++*this;
  return before;
}

}  // namespace appsync::plist
