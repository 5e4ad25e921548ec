// The dictionary: a shape of sorted keys, and values parallel to it.
#include <algorithm>
#include <memory>
#include <numeric>
#include <optional>

#include "plist/internal/Storage.h"

namespace appsync::plist {

namespace {

/// A dictionary keeps at most about twice this alive in addition to itself.
constexpr std::size_t kLargestSlab = 8192;

}  // namespace

DictionaryPayload* DictionaryPayload::make(Shape* shape, std::size_t capacity) {
  void* place = ::operator new(sizeof(DictionaryPayload) + capacity * sizeof(Value));
  return ::new (place) DictionaryPayload(shape, static_cast<std::uint32_t>(capacity));
}

void DictionaryPayload::destroy(DictionaryPayload* dictionary) noexcept {
  std::destroy_n(dictionary->values(), dictionary->count);
  Shape::drop(dictionary->shape);
  Slab* const slab = dictionary->slab;
  dictionary->~DictionaryPayload();
  if (slab != nullptr) {
    Slab::drop(slab);
  } else {
    ::operator delete(dictionary);
  }
}

Slab* Slab::make(std::size_t bytes, std::uint32_t owners) {
  Slab* const slab = ::new (::operator new(sizeof(Slab) + bytes)) Slab;
  slab->owners.store(owners, std::memory_order_relaxed);
  return slab;
}

void Slab::drop(Slab* slab, std::uint32_t times) noexcept {
  if (times == 0 || !slab->release(times)) return;
  slab->~Slab();
  ::operator delete(slab);
}

DictionaryPool::~DictionaryPool() {
  if (shape_ != nullptr) Shape::drop(shape_, left_ + 1);
  if (slab_ != nullptr) Slab::drop(slab_, left_);
}

Dictionary DictionaryPool::make() {
  const std::size_t count = shape_->keys.size();
  const std::size_t bytes = sizeof(DictionaryPayload) + count * sizeof(Value);
  if (left_ == 0) refill(bytes);
  auto* const payload = ::new (next_) DictionaryPayload(shape_, static_cast<std::uint32_t>(count));
  payload->slab = slab_;
  payload->count = payload->capacity;
  std::uninitialized_value_construct_n(payload->values(), count);
  next_ += bytes;
  --left_;
  return Internals::adopt(payload);
}

/// Doubles the number of dictionaries with each slab, because the first may be the only one of its shape.
void DictionaryPool::refill(std::size_t bytesEach) {
  slab_ = Slab::make(bytesEach * atOnce_, atOnce_);
  next_ = slab_->memory();
  left_ = atOnce_;
  shape_->retain(atOnce_);
  if (bytesEach * atOnce_ < kLargestSlab) atOnce_ *= 2;
}

namespace {

std::string_view keyText(const Value& key) noexcept {
  return Internals::text(key);
}

std::size_t positionOf(const Shape& shape, std::string_view key) noexcept {
  const auto place = std::lower_bound(shape.keys.begin(), shape.keys.end(), key,
                                      [](const Value& one, std::string_view other) { return keyText(one) < other; });
  return static_cast<std::size_t>(place - shape.keys.begin());
}

bool holdsAt(const Shape& shape, std::size_t position, std::string_view key) noexcept {
  return position < shape.keys.size() && keyText(shape.keys[position]) == key;
}

/// For up to this many keys linear search is faster than binary search, because most differ in length.
constexpr std::size_t kFewKeys = 8;

/// Returns nullopt if the shape has no such key.
std::optional<std::size_t> positionIn(const Shape& shape, std::string_view key) noexcept {
  if (shape.keys.size() > kFewKeys) {
    const std::size_t position = positionOf(shape, key);
    return holdsAt(shape, position, key) ? std::optional(position) : std::nullopt;
  }
  for (std::size_t position = 0; position < shape.keys.size(); ++position) {
    if (keyText(shape.keys[position]) == key) return position;
  }
  return std::nullopt;
}

/// Returns a payload with one owner and capacity for one more value, in place of `payload`.
DictionaryPayload* withCapacity(DictionaryPayload* payload) {
  const std::size_t count = payload->count;
  if (!payload->isShared() && count < payload->capacity) return payload;
  DictionaryPayload* roomy = DictionaryPayload::make(payload->shape, count < 4 ? 4 : count * 2);
  payload->shape->retain();
  if (payload->isShared()) {
    std::uninitialized_copy_n(payload->values(), count, roomy->values());
  } else {
    std::uninitialized_move_n(payload->values(), count, roomy->values());
  }
  roomy->count = payload->count;
  Container::drop(payload);
  return roomy;
}

/// Makes `payload` the only owner of its shape.
Shape& ownShape(DictionaryPayload& payload) {
  if (payload.shape->isShared()) {
    auto copy = std::make_unique<Shape>();
    copy->keys = payload.shape->keys;
    Shape::drop(payload.shape);
    payload.shape = copy.release();
  }
  return *payload.shape;
}

}  // namespace

Dictionary makeDictionary(std::span<const Value> keys, std::span<Value> values) {
  if (keys.empty()) return {};
  std::vector<std::uint32_t> order(keys.size());
  std::iota(order.begin(), order.end(), 0U);
  const auto before = [&](std::uint32_t one, std::uint32_t other) { return keyText(keys[one]) < keyText(keys[other]); };
  if (!std::is_sorted(order.begin(), order.end(), before)) std::stable_sort(order.begin(), order.end(), before);
  auto shape = std::make_unique<Shape>();
  shape->keys.reserve(keys.size());
  DictionaryPayload* payload = DictionaryPayload::make(shape.get(), keys.size());
  for (std::size_t i = 0; i < order.size(); ++i) {
    const bool isReplaced = i + 1 < order.size() && keyText(keys[order[i]]) == keyText(keys[order[i + 1]]);
    if (isReplaced) continue;
    shape->keys.push_back(keys[order[i]]);
    std::construct_at(payload->values() + payload->count++, std::move(values[order[i]]));
  }
  static_cast<void>(shape.release());  // The payload owns it now.
  return Internals::adopt(payload);
}

Dictionary makeDictionary(DictionaryPool& pool, std::span<const std::uint32_t> places, std::span<Value> values) {
  Dictionary dictionary = pool.make();
  Value* const made = Internals::payload(dictionary)->values();
  for (std::size_t i = 0; i < values.size(); ++i)
    made[places.empty() ? i : places[i]] = std::move(values[i]);
  return dictionary;
}

std::vector<std::uint32_t> placesOf(std::span<const Value> keys, const Shape& shape) {
  std::vector<std::uint32_t> places;
  const auto before = [](const Value& one, const Value& other) { return keyText(one) < keyText(other); };
  if (std::is_sorted(keys.begin(), keys.end(), before)) return places;
  places.reserve(keys.size());
  for (const Value& key : keys)
    places.push_back(static_cast<std::uint32_t>(positionOf(shape, keyText(key))));
  return places;
}

Dictionary::Dictionary(std::initializer_list<std::pair<std::string_view, Value>> entries) {
  std::vector<Value> keys;
  std::vector<Value> values;
  for (const auto& [key, value] : entries) {
    keys.emplace_back(key);
    values.push_back(value);
  }
  *this = makeDictionary(keys, values);
}

Dictionary::Dictionary(const Dictionary& other) noexcept : payload_(other.payload_) {
  if (payload_ != nullptr) payload_->retain();
}

Dictionary::~Dictionary() {
  if (payload_ != nullptr) Container::drop(payload_);
}

std::size_t Dictionary::size() const noexcept {
  return payload_ == nullptr ? 0 : payload_->count;
}

Dictionary::Iterator Dictionary::begin() const noexcept {
  if (payload_ == nullptr) return {};
  return {payload_->shape->keys.data(), payload_->values()};
}

Dictionary::Iterator Dictionary::end() const noexcept {
  if (payload_ == nullptr) return {};
  return {nullptr, payload_->values() + payload_->count};
}

const Value* Dictionary::find(std::string_view key) const noexcept {
  if (payload_ == nullptr) return nullptr;
  const auto position = positionIn(*payload_->shape, key);
  return position ? payload_->values() + *position : nullptr;
}

Value* Dictionary::find(std::string_view key) {
  if (std::as_const(*this).find(key) == nullptr) return nullptr;
  if (payload_->isShared()) payload_ = withCapacity(payload_);
  return payload_->values() + positionOf(*payload_->shape, key);
}

void Dictionary::set(std::string_view key, Value value) {
  if (Value* present = find(key)) {
    *present = std::move(value);
    return;
  }
  if (payload_ == nullptr) payload_ = DictionaryPayload::make(new Shape, 4);
  Value name(key);  // First: `key` may be part of a value that is moved below.
  payload_ = withCapacity(payload_);
  Shape& shape = ownShape(*payload_);
  const std::size_t position = positionOf(shape, keyText(name));
  shape.keys.insert(shape.keys.begin() + static_cast<std::ptrdiff_t>(position), std::move(name));
  Value* values = payload_->values();
  std::construct_at(values + payload_->count++);
  std::move_backward(values + position, values + payload_->count - 1, values + payload_->count);
  values[position] = std::move(value);
}

bool Dictionary::erase(std::string_view key) {
  if (std::as_const(*this).find(key) == nullptr) return false;
  if (payload_->isShared()) payload_ = withCapacity(payload_);
  Shape& shape = ownShape(*payload_);
  const std::size_t position = positionOf(shape, key);
  shape.keys.erase(shape.keys.begin() + static_cast<std::ptrdiff_t>(position));
  Value* values = payload_->values();
  std::move(values + position + 1, values + payload_->count, values + position);
  std::destroy_at(values + --payload_->count);
  return true;
}

}  // namespace appsync::plist
