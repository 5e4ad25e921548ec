// Ownership, comparison and destruction of values.
#include <algorithm>
#include <cmath>
#include <set>

#include "plist/Value.h"
#include "plist/internal/Storage.h"

namespace appsync::plist {

TextPayload* TextPayload::make(std::size_t size) {
  void* place = ::operator new(sizeof(TextPayload) + size);
  auto* text = ::new (place) TextPayload;
  text->size = size;
  return text;
}

void TextPayload::destroy(TextPayload* text) noexcept {
  text->~TextPayload();
  ::operator delete(text);
}

namespace {

/// Containers nested deeper than this are destroyed in a loop instead of by recursion.
constexpr int kMaximumDestructionDepth = 64;

struct Destruction {
  int depth = 0;
  Container* waiting = nullptr;
};

thread_local Destruction destruction;

}  // namespace

void Container::destroy(Container* container) noexcept {
  if (container->kind == Kind::array) {
    delete static_cast<ArrayPayload*>(container);
  } else {
    DictionaryPayload::destroy(static_cast<DictionaryPayload*>(container));
  }
}

void Container::destroyLater(Container* container) noexcept {
  if (destruction.depth == kMaximumDestructionDepth) {
    container->nextToDestroy = std::exchange(destruction.waiting, container);
    return;
  }
  ++destruction.depth;
  destroy(container);
  if (destruction.depth == 1) {
    while (destruction.waiting != nullptr) {
      Container* next = destruction.waiting;
      destruction.waiting = next->nextToDestroy;
      destroy(next);
    }
  }
  --destruction.depth;
}

Value::Value(Bytes bytes) {
  if (bytes.size() <= kInlineCapacity) {
    *this = data(bytes);
  } else {
    store<Payload*>(Type::data, new DataPayload(std::move(bytes)), kShared);
  }
}

Value::Value(Array elements) {
  store<Payload*>(Type::array, new ArrayPayload(std::move(elements)), kShared);
}

void Value::storeLong(std::string_view bytes) {
  if (bits_.type == Type::data) {
    const auto* first = reinterpret_cast<const std::byte*>(bytes.data());
    return store<Payload*>(Type::data, new DataPayload(Bytes(first, first + bytes.size())), kShared);
  }
  TextPayload* payload = TextPayload::make(bytes.size());
  std::memcpy(payload->bytes(), bytes.data(), bytes.size());
  store<Payload*>(Type::string, payload, kShared);
}

std::string_view Value::longText() const noexcept {
  auto* payload = load<Payload*>();
  if (bits_.type == Type::data) return textOf(static_cast<DataPayload*>(payload)->bytes);
  auto* text = static_cast<TextPayload*>(payload);
  return {text->bytes(), text->size};
}

void Value::retain() const noexcept {
  if (auto* payload = load<Payload*>()) payload->retain();
}

void Value::release() noexcept {
  auto* payload = load<Payload*>();
  if (payload == nullptr) return;
  switch (bits_.type) {
    case Type::string:
      if (payload->release()) TextPayload::destroy(static_cast<TextPayload*>(payload));
      return;
    case Type::data:
      if (payload->release()) delete static_cast<DataPayload*>(payload);
      return;
    default:
      return Container::drop(static_cast<Container*>(payload));
  }
}

const Array* Value::array() const noexcept {
  return bits_.type == Type::array ? &static_cast<ArrayPayload*>(load<Payload*>())->elements : nullptr;
}

Array* Value::array() {
  if (bits_.type != Type::array) return nullptr;
  auto* payload = static_cast<ArrayPayload*>(load<Payload*>());
  if (payload->isShared()) *this = Value(Array(payload->elements));
  return &static_cast<ArrayPayload*>(load<Payload*>())->elements;
}

namespace {

struct Pairs {
  /// Pairs of values to be compared. A list instead of recursion, which would be as deep as the nesting.
  std::vector<std::pair<const Value*, const Value*>> waiting;
  /// Pairs of long content known to be equal. Documents often refer to the same content repeatedly.
  std::set<std::pair<const char*, const char*>> equal;
};

bool sameReal(double one, double other) noexcept {
  return one == other || (std::isnan(one) && std::isnan(other));
}

/// Compares repeated long content once.
bool sameText(std::string_view one, std::string_view other, Pairs& pairs) {
  constexpr std::size_t kLong = 4096;
  if (one.size() < kLong || one.size() != other.size()) return one == other;
  if (one.data() == other.data() || pairs.equal.contains({one.data(), other.data()})) return true;
  if (one != other) return false;
  pairs.equal.emplace(one.data(), other.data());
  return true;
}

bool queueElements(const Array& one, const Array& other, Pairs& pairs) {
  if (one.size() != other.size()) return false;
  for (std::size_t i = 0; i < one.size(); ++i)
    pairs.waiting.emplace_back(&one[i], &other[i]);
  return true;
}

bool sameKeys(const Shape& one, const Shape& other, Pairs& pairs) {
  return std::ranges::equal(one.keys, other.keys, [&pairs](const Value& left, const Value& right) {
    return sameText(Internals::text(left), Internals::text(right), pairs);
  });
}

bool queueEntries(const Dictionary& one, const Dictionary& other, Pairs& pairs) {
  DictionaryPayload* left = Internals::payload(one);
  DictionaryPayload* right = Internals::payload(other);
  if (left == right) return true;
  if (one.size() != other.size()) return false;
  if (one.empty()) return true;
  if (left->shape != right->shape && !sameKeys(*left->shape, *right->shape, pairs)) return false;
  for (std::uint32_t i = 0; i < left->count; ++i)
    pairs.waiting.emplace_back(left->values() + i, right->values() + i);
  return true;
}

bool sameContent(const Value& one, const Value& other, Pairs& pairs) {
  if (one.type() != other.type()) return false;
  switch (one.type()) {
    case Type::string:
    case Type::data:
      return sameText(Internals::text(one), Internals::text(other), pairs);
    case Type::real:
      return sameReal(*one.number(), *other.number());
    case Type::date:
      return sameReal(one.date()->seconds, other.date()->seconds);
    case Type::array:
      return one.array() == other.array() || queueElements(*one.array(), *other.array(), pairs);
    case Type::dictionary:
      return queueEntries(*one.dictionary(), *other.dictionary(), pairs);
    default:
      return std::memcmp(Internals::bits(one), Internals::bits(other), sizeof(Value)) == 0;
  }
}

bool drain(Pairs& pairs) {
  while (!pairs.waiting.empty()) {
    const auto [one, other] = pairs.waiting.back();
    pairs.waiting.pop_back();
    if (!sameContent(*one, *other, pairs)) return false;
  }
  return true;
}

}  // namespace

bool Value::operator==(const Value& other) const {
  Pairs pairs;
  return sameContent(*this, other, pairs) && drain(pairs);
}

bool Dictionary::operator==(const Dictionary& other) const {
  Pairs pairs;
  return queueEntries(*this, other, pairs) && drain(pairs);
}

}  // namespace appsync::plist
