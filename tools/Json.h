// JSON as the tool writes it.
#pragma once

#include <string>

#include <nlohmann/json.hpp>

namespace appsync::tools {

/// Keeps members in the order in which they were added.
using Json = nlohmann::ordered_json;

/// On one line. Bytes that are no UTF-8 are replaced, so that the result always is JSON.
[[nodiscard]] inline std::string onOneLine(const Json& json) {
  return json.dump(-1, ' ', false, Json::error_handler_t::replace);
}

/// Indented for people, with the same promise.
[[nodiscard]] inline std::string indented(const Json& json) {
  return json.dump(2, ' ', false, Json::error_handler_t::replace);
}

}  // namespace appsync::tools
