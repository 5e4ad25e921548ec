// The state of each app, written back into the host's todo list.
#include <utility>

#include "common/TodoList.h"
#include "core/AppsClient.h"
#include "platform/SyncFiles.h"
#include "plist/Access.h"

namespace appsync {

void AppsClient::changeAssetID(std::string_view identifier, std::string_view toDo) {
  auto list = _loadPlist(_platform, kTodoListPath, nullptr);
  if (!list || !todo::setOperation(*list, identifier, toDo, _log)) return;
  todo::save(_platform.fileSystem(), kTodoListPath, std::move(*list)).ignore();
}

std::optional<plist::Value> AppsClient::_operationStateForIdentifier(std::string_view identifier) {
  const auto list = _loadPlist(_platform, kTodoListPath, nullptr);
  const plist::Value* entry = list ? todo::find(*list, identifier) : nullptr;
  const plist::Value* operation = plist::find(entry, todo::kOperation);
  return operation == nullptr ? std::nullopt : std::optional(*operation);
}

}  // namespace appsync
