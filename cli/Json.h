// JSON output, and property lists as JSON.
#pragma once

#include <string>

#include <nlohmann/json.hpp>

#include "plist/PropertyList.h"

namespace appsync::cli {

/// Keeps members in the order in which they were added.
using Json = nlohmann::ordered_json;

/// Returns `json` on one line, always as valid JSON: invalid UTF-8 is replaced, and characters that are unsafe for a
/// terminal are escaped.
[[nodiscard]] std::string onOneLine(const Json& json);

/// Returns `json` indented for users, with the same guarantees as `onOneLine`.
[[nodiscard]] std::string indented(const Json& json);

/// Converts a property list: data becomes base64 text, a date ISO 8601 text in UTC, a uid {"CF$UID": number}, and a
/// real without a JSON form null. All other types have a JSON equivalent.
[[nodiscard]] Json toJson(const plist::Value& value);

}  // namespace appsync::cli
