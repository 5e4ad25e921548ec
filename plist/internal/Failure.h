// Errors of property-list readers and writers.
#pragma once

#include <string>
#include <string_view>

#include "plist/PropertyList.h"

namespace appsync::plist {

inline Error failure(Failure kind, std::string_view what) {
  return {std::string(domains::kPropertyList), static_cast<long>(kind), std::string(what), nullptr};
}

inline Error failureAt(Failure kind, std::string_view what, std::size_t byte) {
  return failure(kind, std::string(what) + " at byte " + std::to_string(byte));
}

}  // namespace appsync::plist
