// CoordinatedInstallContract: the fixture.
#include "kit/contracts/InstallCoordinationContract.h"

namespace appsync::test {

using platform::FileLocation;
using platform::IfMissing;
using platform::InstallCoordinator;
using platform::InstallOptions;
using platform::PlaceholderLookup;
using platform::TSInstallType;

GTEST_ALLOW_UNINSTANTIATED_PARAMETERIZED_TEST(CoordinatedInstallContract);

CoordinatedInstallContract::Coordinator CoordinatedInstallContract::coordinator(std::string_view identifier, Kind kind,
                                                                                Client client) {
  std::optional<Error> error;
  Coordinator made = service().coordinatorForApp(kind, identifier, client, IfMissing::create, nullptr, &error);
  EXPECT_NE(made, nullptr) << (error ? error->text : "and no error");
  return made;
}

CoordinatedInstallContract::Coordinator CoordinatedInstallContract::find(std::string_view identifier, Kind kind,
                                                                         Client client) {
  std::optional<Error> error;
  Coordinator found = service().coordinatorForApp(kind, identifier, client, IfMissing::findNothing, nullptr, &error);
  EXPECT_EQ(error, std::nullopt);
  return found;
}

CoordinatedInstallContract::Asset CoordinatedInstallContract::makeAsset(std::string_view name, Client client) {
  Asset asset = service().makePromisedTransferToPath(name, client, std::nullopt, 0);
  EXPECT_NE(asset, nullptr);
  return asset;
}

CoordinatedInstallContract::UserData CoordinatedInstallContract::makeUserData(std::string_view name, Client client) {
  UserData userData = service().makePromisedOutOfBandTransfer(name, client, 0);
  EXPECT_NE(userData, nullptr);
  return userData;
}

CoordinatedInstallContract::AppPlaceholder CoordinatedInstallContract::makePlaceholder(std::string_view identifier,
                                                                                       TSInstallType installType) {
  AppPlaceholder placeholder = service().initAppPlaceholder("The App", identifier, installType, kSync);
  EXPECT_NE(placeholder, nullptr);
  return placeholder;
}

CoordinatedInstallContract::AppPlaceholder CoordinatedInstallContract::makeConfiguredPlaceholder(
    std::string_view identifier) {
  AppPlaceholder placeholder = makePlaceholder(identifier);
  platform::PlaceholderAttributes attributes;
  attributes.setBundleVersion("1.0");
  EXPECT_TRUE(placeholder->setPlaceholderAttributes(attributes));
  EXPECT_TRUE(placeholder->setMetadata(std::nullopt));
  EXPECT_TRUE(placeholder->setConfigurationComplete());
  return placeholder;
}

InstallOptions CoordinatedInstallContract::options() {
  InstallOptions options;
  options.setInstallType(TSInstallType::Restore);
  options.setInstallTargetType(1);
  return options;
}

CoordinatedInstallContract::Asset CoordinatedInstallContract::prepare(InstallCoordinator& coordinator) {
  const std::string identifier = coordinator.bundleID().value_or("");
  EXPECT_TRUE(coordinator.setInstallOptions(options()));
  EXPECT_TRUE(coordinator.setInitialODRAssetPromises({}));
  Asset asset = makeAsset(identifier + "-Asset");
  EXPECT_TRUE(coordinator.setAppAssetPromise(asset));
  EXPECT_TRUE(coordinator.setPlaceholderPromise(makeConfiguredPlaceholder(identifier)));
  return asset;
}

void CoordinatedInstallContract::deliver(platform::PromisedTransferToPath& asset, const FileLocation& package) {
  asset.setTransferPath(package);
  asset.setPercentComplete(1);
  asset.setComplete(true);
}

void CoordinatedInstallContract::install(std::string_view identifier, std::string_view version) {
  const Coordinator installing = coordinator(identifier);
  deliver(*prepare(*installing), subject().makePackage(identifier, version));
  subject().waitUntilIdle();
  ASSERT_EQ(stateOf(identifier), "installed");
  ASSERT_EQ(versionOf(identifier), version);
}

Error CoordinatedInstallContract::reason() {
  return {"ZTError", 30, "never came", nullptr};
}

Status CoordinatedInstallContract::cancel(InstallCoordinator& coordinator) {
  return coordinator.cancelForReason(reason(), coordinator.creatorIdentifier());
}

std::string CoordinatedInstallContract::stateOf(std::string_view identifier) {
  const auto record = subject().registry().recordForIdentifier(identifier, PlaceholderLookup::on);
  if (record == nullptr) return "absent";
  if (record->isInstalled()) return record->isPlaceholder() ? "both" : "installed";
  return record->isPlaceholder() ? "placeholder" : "neither";
}

std::optional<std::string> CoordinatedInstallContract::versionOf(std::string_view identifier) {
  const auto record = subject().registry().recordForIdentifier(identifier, PlaceholderLookup::on);
  return record == nullptr ? std::nullopt : record->bundleVersion();
}

}  // namespace appsync::test
