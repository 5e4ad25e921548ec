// Accessors of values.
#include "plist/PropertyList.h"
#include "plist/internal/Storage.h"

namespace appsync::plist {

std::optional<bool> Value::boolean() const noexcept {
  if (bits_.type != Type::boolean) return std::nullopt;
  return bits_.length != 0;
}

std::optional<std::int64_t> Value::int64() const noexcept {
  if (bits_.type != Type::integer || bits_.length == kAboveSigned) return std::nullopt;
  return load<std::int64_t>();
}

std::optional<std::uint64_t> Value::uint64() const noexcept {
  if (bits_.type != Type::integer) return std::nullopt;
  if (bits_.length != kAboveSigned && load<std::int64_t>() < 0) return std::nullopt;
  return load<std::uint64_t>();
}

std::optional<double> Value::number() const noexcept {
  if (bits_.type == Type::real) return load<double>();
  if (bits_.type != Type::integer) return std::nullopt;
  if (bits_.length == kAboveSigned) return static_cast<double>(load<std::uint64_t>());
  return static_cast<double>(load<std::int64_t>());
}

std::optional<ByteView> Value::data() const noexcept {
  if (bits_.type != Type::data) return std::nullopt;
  return bytesOf(text());
}

std::optional<Date> Value::date() const noexcept {
  if (bits_.type != Type::date) return std::nullopt;
  return Date{load<double>()};
}

std::optional<Uid> Value::uid() const noexcept {
  if (bits_.type != Type::uid) return std::nullopt;
  return Uid{load<std::uint64_t>()};
}

namespace {

bool isTrueWord(std::string_view text) noexcept {
  const std::size_t start = text.find_first_not_of(" \t\r\n");
  if (start == std::string_view::npos) return false;
  text.remove_prefix(start);
  if (text.front() == '+' || text.front() == '-')
    text.remove_prefix(1);
  else if (std::string_view("yYtT").find(text.front()) != std::string_view::npos)
    return true;
  const std::size_t digit = text.find_first_not_of('0');
  return digit != std::string_view::npos && text[digit] >= '1' && text[digit] <= '9';
}

}  // namespace

std::optional<bool> truth(const Value& value) noexcept {
  if (const auto answer = value.boolean()) return answer;
  if (const auto number = value.number()) return *number != 0;
  if (const auto text = value.string()) return isTrueWord(*text);
  return std::nullopt;
}

}  // namespace appsync::plist
