// How far each app of the host's todo list has come, written back into it.
#include <utility>

#include "common/TodoList.h"
#include "core/AppsClient.h"
#include "platform/SyncFiles.h"
#include "plist/Access.h"

namespace appsync {

void AppsClient::changeAssetID(std::string_view identifier, std::string_view toDo) {
  auto todoList = _loadPlist(_platform, kTodoListPath, nullptr);
  plist::Value* entry = todoList ? firstEntry(*todoList, identifier) : nullptr;
  if (entry == nullptr) return;

  _log.message("%s|Changing %{public}@ from %{public}@ to %{public}@", identifier,
               std::as_const(*entry).find(todo::kOperation), toDo);
  entry->dictionary()->set(todo::kOperation, toDo);
  const auto bytes = plist::writeBinary(std::move(*todoList));
  if (bytes) _platform.fileSystem().writeFileAtomically(kTodoListPath, *bytes).ignore();
}

std::optional<plist::Value> AppsClient::_operationStateForIdentifier(std::string_view identifier) {
  const auto todoList = _loadPlist(_platform, kTodoListPath, nullptr);
  const plist::Value* entry = todoList ? firstEntry(*todoList, identifier) : nullptr;
  const plist::Value* operation = plist::find(entry, todo::kOperation);
  return operation == nullptr ? std::nullopt : std::optional(*operation);
}

}  // namespace appsync
