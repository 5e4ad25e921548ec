// Property-list files of the host and of the plug-in, as tests put them down and read them back.
#pragma once

#include <optional>
#include <string>
#include <string_view>

#include "kit/fakes/FakeFileSystem.h"
#include "plist/PropertyList.h"

namespace appsync::test {

/// The host's todo list where the host leaves it, and where the plug-in works on it.
inline constexpr std::string_view kStagedTodoListPath =
    "/var/mobile/Media/PublicStaging/ApplicationSync/ApplicationsSync.plist";
inline constexpr std::string_view kTodoListPath =
    "/var/mobile/Library/ApplicationSync/HarvoStuff/ApplicationsSync.plist";

// Entries of a todo list.
[[nodiscard]] plist::Dictionary installEntry(std::string_view identifier, std::string_view version = "1.0",
                                             std::string_view name = "Name");
[[nodiscard]] plist::Dictionary removeEntry(std::string_view identifier);
[[nodiscard]] plist::Dictionary entry(std::string_view identifier, std::string_view operation);

// The two file forms; the value must be writable.
[[nodiscard]] Bytes binaryForm(const plist::Value& value);
[[nodiscard]] Bytes xmlForm(const plist::Value& value);

/// Puts a property list down in its XML form.
void putPropertyList(FakeFileSystem& files, std::string_view path, const plist::Value& value);

/// What is there, in either form; none when there is no file or it cannot be read.
[[nodiscard]] std::optional<plist::Value> propertyListAt(FakeFileSystem& files, std::string_view path);

/// The operation word of the first entry for that app in the todo list that the plug-in works on.
[[nodiscard]] std::optional<std::string> operationWord(FakeFileSystem& files, std::string_view identifier);

/// An app's folder with an info dictionary that names all and an icon, "icon of <identifier>".
void putAppFolder(FakeFileSystem& files, std::string_view folder, std::string_view identifier,
                  std::string_view displayName);

}  // namespace appsync::test
