#include "common/Identifiers.h"

#include "plist/Access.h"
#include "plist/PropertyList.h"

namespace appsync {

bool isValidBundleIdentifier(const plist::Value* value) {
  const auto text = plist::stringIn(value);
  return text && isValidBundleIdentifier(*text);
}

bool isValidBundleIdentifier(std::string_view text) {
  return text.find("/..") == std::string_view::npos;
}

}  // namespace appsync
