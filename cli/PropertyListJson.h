// Property lists as JSON, for people and scripts.
#pragma once

#include "cli/Json.h"
#include "plist/PropertyList.h"

namespace appsync::cli {

/// Data becomes base64 text, a date ISO 8601 text in UTC, a uid {"CF$UID": number}, and a real that JSON has no number
/// for null. Everything else has a form of its own in JSON.
[[nodiscard]] Json toJson(const plist::Value& value);

}  // namespace appsync::cli
