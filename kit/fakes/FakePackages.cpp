#include "kit/fakes/FakePackages.h"

#include "platform/Keys.h"
#include "plist/Access.h"

namespace appsync::test {

namespace {

using platform::TSInstallPhase;
using platform::TSInstallState;
using platform::TSInstallType;

constexpr long kInstallerFailure = 1;

std::optional<PackageKind> kindIn(const plist::Dictionary& options) {
  const std::optional<std::string> word = ownedStringIn(options.find(platform::PackageTypeKey));
  if (word == platform::kPackageTypeCustomer) return PackageKind::app;
  if (word == platform::PackageTypePlaceholder) return PackageKind::placeholder;
  return std::nullopt;
}

}  // namespace

Bytes packageOf(std::string_view identifier, std::string_view version) {
  const plist::Dictionary content{{platform::BundleIdentifierKey, identifier}, {platform::kBundleVersionKey, version}};
  return plist::writeBinary(content).value();
}

Error installerError(std::string text) {
  return {std::string(platform::kInstallerErrorDomain), kInstallerFailure, std::move(text), nullptr};
}

std::string identifierIn(const plist::Dictionary& options) {
  return ownedStringIn(options.find(platform::BundleIdentifierKey)).value_or("");
}

Result<FakePackage> readPackage(FakeFileSystem& files, const platform::FileLocation& location,
                                const plist::Dictionary& options) {
  const std::string identifier = identifierIn(options);
  const std::optional<PackageKind> kind = kindIn(options);
  if (identifier.empty() || !kind) return installerError("the options name no app or no kind of package");
  const bool isPlaceholder = *kind == PackageKind::placeholder;
  const std::optional<Bytes> bytes = files.contents(isPlaceholder ? location.path + "/Info.plist" : location.path);
  if (!bytes || bytes->empty()) return installerError("no package at " + location.path);
  const Result<plist::Value> info = plist::read(*bytes);
  const std::optional<std::string> named =
      info ? ownedStringIn(info->find(platform::BundleIdentifierKey)) : std::optional<std::string>();
  if (isPlaceholder ? named != identifier : named && named != identifier) {
    return installerError(location.path + " does not hold " + identifier);
  }
  return FakePackage{*kind, info ? ownedStringIn(info->find(platform::kBundleVersionKey)) : std::nullopt,
                     bytes->size()};
}

void applyPackage(FakeApp& app, const FakePackage& package, const plist::Dictionary& options) {
  const bool leavesTheApp = app.isInstalled && package.kind == PackageKind::placeholder;
  if (package.version && !leavesTheApp) app.version = package.version;
  if (!leavesTheApp) app.staticDiskUsage = package.size;
  app.installOptions = options;
  const plist::Value* type = options.find(platform::kInstallTypeKey);
  const std::optional<std::uint64_t> number = type == nullptr ? std::nullopt : type->uint64();
  if (number) app.installType = static_cast<TSInstallType>(*number);
  app.isPlaceholder = package.kind == PackageKind::placeholder;
  if (app.isPlaceholder) {
    if (app.progress == nullptr) app.progress = std::make_shared<FakeInstallProgress>(app.identifier);
    return;
  }
  app.isInstalled = true;
  if (app.progress) app.progress->end(TSInstallState::Finished);
  app.progress = nullptr;
}

}  // namespace appsync::test
