#include "platform/SyncFiles.h"

#include <optional>

#include "core/AppsClient.h"
#include "plist/Access.h"

namespace appsync {

bool isValidBundleIdentifier(const plist::Value* value) {
  const auto text = stringIn(value);
  return text && isValidBundleIdentifier(*text);
}

bool isValidBundleIdentifier(std::string_view text) {
  return text.find("/..") == std::string_view::npos;
}

std::optional<plist::Array> AppsClient::_loadPlist(platform::Platform& platform, std::string_view path,
                                                   ErrorSlot error) {
  const auto bytes = platform.fileSystem().readFile(path);
  if (!bytes) {
    setError(error, bytes.error());
    return std::nullopt;
  }
  if (bytes->empty()) return std::nullopt;

  const PlugInLog log(platform.syncFramework());
  auto list = plist::readBinaryOrXML(*bytes);
  if (!list) {
    setError(error, list.error());
    log.error("%s|couldn't parse todo list");
    return std::nullopt;
  }
  plist::Array* entries = list->array();
  if (entries == nullptr) {
    log.error("%s|todo list is not an array");
    return std::nullopt;
  }
  return std::move(*entries);
}

}  // namespace appsync
