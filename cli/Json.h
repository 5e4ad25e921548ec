// JSON as the tool writes it.
#pragma once

#include <string>

#include <nlohmann/json.hpp>

#include "cli/Printable.h"

namespace appsync::cli {

/// Keeps members in the order in which they were added.
using Json = nlohmann::ordered_json;

/// On one line. Bytes that are no UTF-8 are replaced, so that the result always is JSON; what would command a terminal
/// stands in it by number.
[[nodiscard]] inline std::string onOneLine(const Json& json) {
  return withReferences(json.dump(-1, ' ', false, Json::error_handler_t::replace), Notation::json);
}

/// Indented for people, with the same promise.
[[nodiscard]] inline std::string indented(const Json& json) {
  return withReferences(json.dump(2, ' ', false, Json::error_handler_t::replace), Notation::json);
}

}  // namespace appsync::cli
