// Coordinators' placeholders on the home screen.
#include <filesystem>
#include <set>

#include <gmock/gmock.h>

#include "device/screen/ScreenPicture.h"
#include "tests/device/InjectedFault.h"
#include "tests/device/coordination/ServiceFixture.h"
#include "tests/device/screen/Pictures.h"

namespace appsync::test {
namespace {

using platform::TSInstallType;
using testing::ElementsAre;

std::vector<std::string> namesIn(const std::filesystem::path& folder) {
  std::set<std::string> names;
  for (const auto& entry : std::filesystem::directory_iterator(folder))
    names.insert(entry.path().filename().string());
  return {names.begin(), names.end()};
}

class CoordinatedPlaceholder : public CoordinationTest {};

}  // namespace

TEST_F(CoordinatedPlaceholder, CreatesAppFolder) {
  const auto icon = device_.stage("Icon.png", textOf(makePNG(60, 60, kGreen)));
  auto placeholder = service().initAppPlaceholder("My Notes", "com.a", TSInstallType::Sync, kSync);
  auto attributes = platform::PlaceholderAttributes::initWithInfoPlistDictionary(
      {{"UIPeriodixApp", true}, {"BundleIconFile", "Other.png"}, {"BundleVersion", "0.1"}});
  attributes.setBundleVersion("2.5");
  attributes.setLaunchProhibited(true);
  auto promise = client_.service().makePromisedTransferToPath("icon", kSync, icon, 10);
  promise->setComplete(true);
  ASSERT_TRUE(placeholder->setIconPromise(promise).ok());
  ASSERT_TRUE(placeholder->setPlaceholderAttributes(attributes).ok());
  ASSERT_TRUE(placeholder->setMetadata(platform::StoreMetadata::initWithDictionary({{"title", "N"}})).ok());
  ASSERT_TRUE(placeholder->setConfigurationComplete().ok());
  ASSERT_TRUE(client_.make("com.a")->setPlaceholderPromise(placeholder).ok());
  EXPECT_EQ(device_.record("com.a")->bundlePath(), *device_.record("com.a")->bundleContainerPath() + "/com.a.app");
  EXPECT_THAT(namesIn(container("com.a")), ElementsAre("HarvoMetadata.plist", "com.a.app"));
  EXPECT_THAT(namesIn(container("com.a") + "/com.a.app"), ElementsAre("Icon.png", "Info.plist"));
  EXPECT_EQ(readHostFile(container("com.a") + "/com.a.app/Icon.png"), readHostFile(device_.host(icon.path)));
  EXPECT_EQ(info("com.a"), (plist::Dictionary{{"BundleDisplayName", "My Notes"},
                                              {"BundleExecutable", "My Notes"},
                                              {"BundleIconFile", "Icon.png"},
                                              {"BundleIdentifier", "com.a"},
                                              {"BundleVersion", "2.5"},
                                              {"TSApplicationLaunchProhibited", true},
                                              {"UIPeriodixApp", true}}));
  EXPECT_EQ(state("com.a"), "2.5 placeholder");
  EXPECT_TRUE(exists(icon));
  EXPECT_EQ(*device_.services().homeScreen().iconOrder(), std::vector<std::string>{"com.a"});
}

TEST_F(CoordinatedPlaceholder, ShowsConfiguredPlaceholder) {
  const auto coordinator = client_.make("com.a");
  const auto connection = listen(delegate_);
  const auto placeholder = service().initAppPlaceholder("", "com.a", TSInstallType::Sync, kSync);
  ASSERT_TRUE(coordinator->setPlaceholderPromise(placeholder).ok());
  EXPECT_EQ(state("com.a"), "none");
  ASSERT_TRUE(placeholder->setConfigurationComplete().ok());
  EXPECT_EQ(state("com.a"), "no version placeholder");
  EXPECT_EQ(info("com.a").find("BundleDisplayName")->string(), "com.a");
  client_.settle();
  EXPECT_THAT(delegate_.reports(), ElementsAre("placeholder com.a"));
}

TEST_F(CoordinatedPlaceholder, AddsLateIcon) {
  const auto icon = device_.stage("Icon.png", "a picture");
  const auto coordinator = client_.make("com.a");
  ASSERT_TRUE(coordinator->setAppAssetPromise(client_.promise("p")).ok());
  auto placeholder = service().initAppPlaceholder("N", "com.a", TSInstallType::Sync, kSync);
  auto promise = client_.promise("icon");
  ASSERT_TRUE(placeholder->setIconPromise(promise).ok());
  ASSERT_TRUE(placeholder->setConfigurationComplete().ok());
  ASSERT_TRUE(coordinator->setPlaceholderPromise(placeholder).ok());
  EXPECT_EQ(info("com.a").find("BundleIconFile"), nullptr);
  coordinator->appAssetPromise()->setPercentComplete(0.5);
  promise->setTransferPath(icon);
  promise->setComplete(true);
  EXPECT_EQ(readHostFile(container("com.a") + "/com.a.app/Icon.png"), "a picture");
  EXPECT_EQ(progress("com.a")->completedUnitCount(), 500);
  EXPECT_EQ(device_.containers(), 1);
}

TEST_F(CoordinatedPlaceholder, OmitsUnreadableIcon) {
  for (const auto& path : {"/var/mobile/missing.png", "/var/mobile", "/../../etc/passwd", "relative.png"}) {
    auto placeholder = service().initAppPlaceholder("N", "com.a", TSInstallType::Sync, kSync);
    auto promise = service().makePromisedTransferToPath("icon", kSync, platform::FileLocation{path}, 10);
    promise->setComplete(true);
    ASSERT_TRUE(placeholder->setIconPromise(promise).ok());
    ASSERT_TRUE(placeholder->setConfigurationComplete().ok());
    const auto coordinator = client_.make("com.a");
    ASSERT_TRUE(coordinator->setPlaceholderPromise(placeholder).ok()) << path;
    EXPECT_THAT(namesIn(container("com.a") + "/com.a.app"), ElementsAre("Info.plist")) << path;
    ASSERT_TRUE(coordinator->cancelForReason(kEnough, kSync).ok());
  }
}

TEST_F(CoordinatedPlaceholder, FailureChangesNothing) {
  const auto coordinator = client_.make("com.a");
  const auto placeholder = client_.placeholder("com.a");
  const Status refused =
      withFaultHook([](const char* name) { return std::string_view(name) == "create file" ? ENOSPC : 0; },
                    [&] { return coordinator->setPlaceholderPromise(placeholder); });
  ASSERT_FALSE(refused.ok());
  EXPECT_EQ(refused.error().code, ENOSPC);
  EXPECT_FALSE(coordinator->hasPlaceholderPromise());
  EXPECT_EQ(state("com.a"), "none");
  EXPECT_EQ(device_.containers(), 0);
  EXPECT_TRUE(coordinator->setPlaceholderPromise(placeholder).ok());
}

TEST_F(CoordinatedPlaceholder, RejectsNameThatCannotBeEncoded) {
  const auto placeholder = service().initAppPlaceholder("\xFF\xFE", "com.a", TSInstallType::Sync, kSync);
  ASSERT_TRUE(placeholder->setConfigurationComplete().ok());
  EXPECT_FALSE(client_.make("com.a")->setPlaceholderPromise(placeholder).ok());
  EXPECT_EQ(state("com.a"), "none");
}

TEST_F(CoordinatedPlaceholder, AcceptsVeryLongName) {
  const std::string name(65536, 'n');
  ASSERT_TRUE(client_.make("com.a")->setPlaceholderPromise(client_.placeholder("com.a", name)).ok());
  EXPECT_EQ(info("com.a").find("BundleDisplayName")->string(), name);
  EXPECT_EQ(service().list()->front().name, name);
  const TemporaryFolder folder;
  device::Services& services = device_.services();
  EXPECT_TRUE(device::drawScreen(
                  {services.homeScreen(), services.defaultRegistry(), services.bundles(), services.iconRenderer()},
                  folder.path("screen.png"))
                  .ok());
}

}  // namespace appsync::test
