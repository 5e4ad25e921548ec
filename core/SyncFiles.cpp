// Reading the sync files.
#include "common/TodoList.h"
#include "core/AppsClient.h"

namespace appsync {

std::optional<plist::Array> AppsClient::_loadPlist(platform::Platform& platform, std::string_view path,
                                                   ErrorSlot error) {
  return todo::load(platform.fileSystem(), path, PlugInLog(platform.syncFramework()), error);
}

}  // namespace appsync
