#include "device/services/Settings.h"

#include <algorithm>
#include <array>
#include <filesystem>
#include <system_error>

#include "device/storage/Database.h"

namespace appsync::device {

namespace {

constexpr std::string_view kInstallation = "app-installation";
constexpr std::string_view kRemoval = "app-removal";
constexpr std::string_view kAssertion = "assertion";
constexpr std::string_view kCoordination = "coordination";
constexpr std::string_view kStore = "store";
constexpr std::string_view kUnset = "unset";

/// In the order of `AssertionAnswer`.
constexpr std::array<std::string_view, 4> kAnswers{"granted", "denied", "unknown", "failing"};

/// A row of the table. Keys with one value have an empty item.
struct Row {
  std::string item;
  std::string value;
};

Error refusal(SettingsFailure failure, std::string text) {
  return {std::string(kSettingsDomain), static_cast<long>(failure), std::move(text), nullptr};
}

Error unknownValue(std::string_view key, std::string_view value, std::string_view expected) {
  std::string text = "setting ";
  text.append(key).append(" cannot be \"").append(value).append("\": it takes ").append(expected);
  return refusal(SettingsFailure::unknownValue, std::move(text));
}

Result<Row> restrictionRow(std::string_view key, std::string_view value) {
  if (value == "yes" || value == "no" || value == kUnset) return Row{"", std::string(value)};
  return unknownValue(key, value, "yes, no or unset");
}

Result<Row> coordinationRow(std::string_view key, std::string_view value) {
  if (value == "on" || value == "off" || value == kUnset) return Row{"", std::string(value)};
  return unknownValue(key, value, "on, off or unset");
}

Result<Row> storeRow(std::string_view key, std::string_view value) {
  if (value == kUnset) return Row{"", std::string(value)};
  std::error_code failure;
  const std::filesystem::path folder = std::filesystem::canonical(value, failure);
  if (failure || !std::filesystem::is_directory(folder, failure)) {
    return unknownValue(key, value, "an existing folder or unset");
  }
  return Row{"", folder.string()};
}

Result<Row> assertionRow(std::string_view key, std::string_view value) {
  const std::size_t colon = value.rfind(':');
  const std::string_view answer = colon == value.npos ? std::string_view() : value.substr(colon + 1);
  const bool isAnswer = answer == kUnset || std::ranges::find(kAnswers, answer) != kAnswers.end();
  if (!isAnswer || colon == 0) {
    return unknownValue(key, value, "ID:granted, ID:denied, ID:unknown, ID:failing or ID:unset");
  }
  return Row{std::string(value.substr(0, colon)), std::string(answer)};
}

struct Definition {
  std::string_view key;
  Result<Row> (*parse)(std::string_view key, std::string_view value);
};

constexpr std::array<Definition, 5> kDefinitions{{
    {kInstallation, restrictionRow},
    {kRemoval, restrictionRow},
    {kAssertion, assertionRow},
    {kCoordination, coordinationRow},
    {kStore, storeRow},
}};

Error unknownKey(std::string_view key) {
  std::string text = "unknown setting \"";
  text.append(key).append("\"; the settings are ");
  for (std::string_view separator; const Definition& definition : kDefinitions) {
    text.append(separator).append(definition.key);
    separator = ", ";
  }
  return refusal(SettingsFailure::unknownKey, std::move(text));
}

}  // namespace

Status Settings::set(std::string_view key, std::string_view value) {
  const auto definition = std::ranges::find(kDefinitions, key, &Definition::key);
  if (definition == kDefinitions.end()) return unknownKey(key);
  const Result<Row> row = definition->parse(key, value);
  if (!row) return row.error();
  Database::Session session(database_);
  if (row->value == kUnset) return session.run("delete from settings where key = ? and item = ?", key, row->item);
  return session.run("insert or replace into settings values (?, ?, ?)", key, row->item, row->value);
}

Status Settings::assign(std::string_view assignment) {
  const std::size_t equals = assignment.find('=');
  if (equals != assignment.npos) return set(assignment.substr(0, equals), assignment.substr(equals + 1));
  return refusal(SettingsFailure::noAssignment, "\"" + std::string(assignment) + "\" is not of the form KEY=VALUE");
}

Status Settings::setAssertionAnswer(std::string_view bundleIdentifier, AssertionAnswer answer) {
  std::string value(bundleIdentifier);
  return set(kAssertion, value.append(":").append(kAnswers[static_cast<std::size_t>(answer)]));
}

platform::RestrictionValue Settings::restriction(platform::RestrictionSetting setting) {
  const bool isInstallation = setting == platform::RestrictionSetting::appInstallationAllowed;
  const auto value = stored(isInstallation ? kInstallation : kRemoval, "");
  if (value == "yes") return platform::RestrictionValue::yes;
  return value == "no" ? platform::RestrictionValue::no : platform::RestrictionValue::unset;
}

bool Settings::coordinationIsOn() {
  return stored(kCoordination, "") == "on";
}

std::optional<std::string> Settings::storeFolder() {
  return stored(kStore, "");
}

std::optional<AssertionAnswer> Settings::assertionAnswer(std::string_view bundleIdentifier) {
  const auto value = stored(kAssertion, bundleIdentifier);
  if (!value) return std::nullopt;
  const auto answer = std::ranges::find(kAnswers, *value);
  if (answer == kAnswers.end()) return std::nullopt;
  return static_cast<AssertionAnswer>(answer - kAnswers.begin());
}

std::optional<std::string> Settings::stored(std::string_view key, std::string_view item) {
  Database::Session session(database_);
  Statement row = session.prepare("select value from settings where key = ? and item = ?", key, item);
  if (!row.next()) return std::nullopt;
  return std::string(row.text(0));
}

}  // namespace appsync::device
