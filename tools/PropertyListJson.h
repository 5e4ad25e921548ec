// Property lists as JSON, for people and scripts.
#pragma once

#include "base/PropertyList.h"
#include "tools/Json.h"

namespace appsync::tools {

/// Data becomes base64 text, a date ISO 8601 text in UTC, a uid {"CF$UID": number}, and a real that JSON has no number
/// for null. Everything else has a form of its own in JSON.
[[nodiscard]] Json toJson(const plist::Value& value);

}  // namespace appsync::tools
