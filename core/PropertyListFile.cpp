#include "core/PropertyListFile.h"

#include <utility>

namespace appsync {

plist::Value readDictionary(platform::FileSystem& files, const std::optional<std::string>& path) {
  const auto bytes = files.readFile(path.value_or(""));
  auto root = bytes ? plist::read(*bytes) : plist::Value();
  return root && root->dictionary() != nullptr ? std::move(root).value() : plist::Value();
}

}  // namespace appsync
