#include "cli/Json.h"

#include <chrono>
#include <cmath>
#include <cstdint>
#include <cstdio>
#include <string>

#include "cli/Printable.h"

namespace appsync::cli {
namespace {

std::string base64(ByteView bytes) {
  constexpr const char* kDigits = "ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789+/";
  std::string text;
  text.reserve((bytes.size() + 2) / 3 * 4);
  for (std::size_t start = 0; start < bytes.size(); start += 3) {
    const std::size_t present = std::min<std::size_t>(3, bytes.size() - start);
    std::uint32_t group = 0;
    for (std::size_t index = 0; index < 3; ++index) {
      group = (group << 8U) | (index < present ? std::to_integer<std::uint32_t>(bytes[start + index]) : 0U);
    }
    for (std::size_t digit = 0; digit < 4; ++digit) {
      text += digit <= present ? kDigits[(group >> (18U - 6U * digit)) & 0x3FU] : '=';
    }
  }
  return text;
}

Json dateText(plist::Date date) {
  using namespace std::chrono;
  constexpr double kLargest = 250'000'000'000;  // seconds; about 8000 years, within the range of std::chrono::year
  if (!(std::abs(date.seconds) < kLargest)) return date.seconds;
  const sys_days reference = year{2001} / 1 / 1;
  const auto moment = reference + milliseconds(std::llround(date.seconds * 1000));
  const sys_days day = floor<days>(moment);
  const year_month_day calendar(day);
  const hh_mm_ss time(moment - day);
  char text[64];
  const int length = std::snprintf(text, sizeof text, "%04d-%02u-%02uT%02d:%02d:%02d",
                                   static_cast<int>(calendar.year()), static_cast<unsigned>(calendar.month()),
                                   static_cast<unsigned>(calendar.day()), static_cast<int>(time.hours().count()),
                                   static_cast<int>(time.minutes().count()), static_cast<int>(time.seconds().count()));
  std::string whole(text, static_cast<std::size_t>(length));
  if (const auto fraction = time.subseconds().count(); fraction != 0) {
    whole += "." + std::to_string(1000 + fraction).substr(1);
  }
  return whole + "Z";
}

Json integerJson(const plist::Value& value) {
  if (const auto number = value.int64()) return *number;
  return *value.uint64();
}

Json arrayJson(const plist::Array& elements) {
  Json json = Json::array();
  for (const plist::Value& element : elements)
    json.push_back(toJson(element));
  return json;
}

Json dictionaryJson(const plist::Dictionary& dictionary) {
  Json json = Json::object();
  // Appended without a look-up, which is linear in an ordered object: the keys are unique already.
  auto& members = json.get_ref<Json::object_t&>();
  members.reserve(dictionary.size());
  for (const auto& [key, value] : dictionary)
    members.push_back({std::string(key), toJson(value)});
  return json;
}

std::string safeText(const Json& json, int indentation) {
  return withReferences(json.dump(indentation, ' ', false, Json::error_handler_t::replace), Notation::json);
}

}  // namespace

std::string onOneLine(const Json& json) {
  return safeText(json, -1);
}

std::string indented(const Json& json) {
  return safeText(json, 2);
}

Json toJson(const plist::Value& value) {
  switch (value.type()) {
    case plist::Type::null:
      return nullptr;
    case plist::Type::boolean:
      return *value.boolean();
    case plist::Type::integer:
      return integerJson(value);
    case plist::Type::real:
      return std::isfinite(*value.number()) ? Json(*value.number()) : Json(nullptr);
    case plist::Type::string:
      return std::string(*value.string());
    case plist::Type::data:
      return base64(*value.data());
    case plist::Type::date:
      return dateText(*value.date());
    case plist::Type::uid:
      return {{"CF$UID", value.uid()->number}};
    case plist::Type::array:
      return arrayJson(*value.array());
    case plist::Type::dictionary:
      return dictionaryJson(*value.dictionary());
  }
  return nullptr;
}

}  // namespace appsync::cli
