// Builds and reads property-list files of the host and the plug-in.
#pragma once

#include <optional>
#include <string>
#include <string_view>

#include "kit/fakes/FakeFileSystem.h"
#include "plist/PropertyList.h"

namespace appsync::test {

/// Paths of the todo list: where the host writes it, and in the plug-in's work area.
inline constexpr std::string_view kStagedTodoListPath =
    "/var/mobile/Media/PublicStaging/ApplicationSync/ApplicationsSync.plist";
inline constexpr std::string_view kTodoListPath =
    "/var/mobile/Library/ApplicationSync/HarvoStuff/ApplicationsSync.plist";

// Return entries of a todo list.
[[nodiscard]] plist::Dictionary installEntry(std::string_view identifier, std::string_view version = "1.0",
                                             std::string_view name = "Name");
[[nodiscard]] plist::Dictionary removeEntry(std::string_view identifier);
[[nodiscard]] plist::Dictionary entry(std::string_view identifier, std::string_view operation);

// Return a value, which must be writable, in binary and XML format.
[[nodiscard]] Bytes binaryForm(const plist::Value& value);
[[nodiscard]] Bytes xmlForm(const plist::Value& value);

/// Writes a property list in XML format.
void putPropertyList(FakeFileSystem& files, std::string_view path, const plist::Value& value);

/// Reads a property list in either format. Returns nullopt if the file is missing or cannot be parsed.
[[nodiscard]] std::optional<plist::Value> propertyListAt(FakeFileSystem& files, std::string_view path);

/// Returns the operation of the first entry for the app in the work area's todo list, or nullopt.
[[nodiscard]] std::optional<std::string> operationWord(FakeFileSystem& files, std::string_view identifier);

/// Writes an app directory: an info dictionary with all its keys, and an icon, "icon of <identifier>".
void putAppFolder(FakeFileSystem& files, std::string_view folder, std::string_view identifier,
                  std::string_view displayName);

}  // namespace appsync::test
