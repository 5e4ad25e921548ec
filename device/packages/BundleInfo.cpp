#include "device/packages/BundleInfo.h"

#include "device/packages/BundleIdentifier.h"
#include "device/packages/InstallerError.h"
#include "platform/SyncFiles.h"
#include "plist/Access.h"

namespace appsync::device {

namespace {

constexpr std::string_view kAppExtension = ".app";

}  // namespace

bool isAppFolder(std::string_view folder) {
  return folder.size() > kAppExtension.size() && folder.ends_with(kAppExtension);
}

std::string_view appFolderStem(std::string_view folder) {
  return folder.substr(0, folder.size() - kAppExtension.size());
}

std::optional<std::string> namedFileIn(const std::string& appPath, const plist::Value* name) {
  const auto text = stringIn(name);
  if (!text || text->empty() || text->find('\0') != text->npos) return std::nullopt;
  std::string path = appPath + '/';
  path += *text;
  const bool leavesApp = (path + '/').find("/../", appPath.size()) != path.npos;
  return leavesApp ? std::nullopt : std::optional(std::move(path));
}

bool isInfoFile(std::string_view path, std::string_view appFolder) {
  return path.size() == appFolder.size() + 1 + kInfoPlistName.size() && path.starts_with(appFolder) &&
         path[appFolder.size()] == '/' && path.ends_with(kInfoPlistName);
}

Error missingInfo(const std::string& appFolder) {
  if (appFolder.empty()) {
    return installerError(InstallerFailure::noApp, "the package holds no app; pack a folder \"Name.app\"");
  }
  return installerError(InstallerFailure::noApp, "the package's \"" + appFolder +
                                                     "\" holds no Info.plist and is no app; add one and pack it again");
}

Result<BundleInfo> readBundleInfo(ByteView document) {
  const Result<plist::Value> root = plist::read(document);
  if (!root) {
    Error error = installerError(InstallerFailure::badInfo,
                                 "the app's Info.plist cannot be read: " + root.error().text + "; write it again");
    error.underlying = std::make_shared<const Error>(root.error());
    return error;
  }
  const plist::Dictionary* dictionary = root->dictionary();
  if (dictionary == nullptr) {
    return installerError(InstallerFailure::badInfo, "the app's Info.plist is no dictionary; write it again");
  }
  std::optional<std::string> identifier = ownedStringIn(dictionary->find(platform::BundleIdentifierKey));
  if (!identifier) {
    return installerError(InstallerFailure::badInfo,
                          "the app's Info.plist names no " + std::string(platform::BundleIdentifierKey) + "; add one");
  }
  if (!isBundleIdentifier(*identifier)) {
    return installerError(
        InstallerFailure::badIdentifier,
        "the app's bundle identifier \"" + *identifier +
            "\" may have only letters, digits, '-', '.' and '_', at most 200 and no dot first; choose another");
  }
  return BundleInfo{*std::move(identifier), ownedStringIn(dictionary->find(platform::kBundleVersionKey)),
                    ownedStringIn(dictionary->find(platform::kBundleDisplayNameKey)), *dictionary};
}

}  // namespace appsync::device
