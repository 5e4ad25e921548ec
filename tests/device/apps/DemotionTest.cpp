#include <filesystem>

#include <gmock/gmock.h>

#include "device/apps/Demotion.h"
#include "platform/SyncFiles.h"
#include "tests/device/screen/Pictures.h"
#include "tests/support/KilledDevice.h"

namespace appsync::test {
namespace {

namespace fs = std::filesystem;

using platform::TSInstallType;
using testing::ElementsAre;
using testing::HasSubstr;

const Bytes kLicence(3, std::byte{7});

class Demotion : public testing::Test {
 protected:
  void SetUp() override {
    const Bytes png = makePNG(60, 60, kGreen);
    const std::string picture(reinterpret_cast<const char*>(png.data()), png.size());
    const std::string info =
        "{BundleIdentifier = \"com.a\"; BundleVersion = \"3.1\"; BundleDisplayName = Notes; "
        "BundleIconFile = \"Pictures/Face.png\"; UIPeriodixApp = YES;}";
    const std::string package = zipArchive({{"Notes.app/Info.plist", info},
                                            {"Notes.app/Pictures/Face.png", picture},
                                            {"Notes.app/data", std::string(5000, 'd')},
                                            {"HarvoMetadata.plist", "{title = Notes;}"},
                                            {"HarvoArtwork", "artwork"}});
    plist::Dictionary options = TestDevice::customer("com.a");
    options.set(platform::kLicenceDataKey, kLicence);
    const Status installed = device_.registry().installApplication(device_.stage("a.zip", package), options);
    ASSERT_TRUE(installed.ok()) << installed.error().text;
  }
  [[nodiscard]] Status demote(std::string_view identifier, TSInstallType type = TSInstallType::IntentionalDowngrade) {
    return device::demote(device_.registry(), device_.files(), identifier, type);
  }
  [[nodiscard]] std::vector<std::string> listed(std::string_view key) {
    const Result<Bytes> bytes = device_.files().readFile(kDemotedAppsPath);
    EXPECT_TRUE(bytes.ok());
    std::vector<std::string> identifiers;
    const Result<plist::Value> root = plist::read(*bytes);
    for (const plist::Value& element : *root->find(key)->array())
      identifiers.emplace_back(*element.string());
    return identifiers;
  }
  [[nodiscard]] std::string appFile(const std::string& name) {
    return device_.host(*device_.record("com.a")->bundlePath()) + "/" + name;
  }

  TestDevice device_;
};

TEST_F(Demotion, KeepsIconNameVersionMetadataAndLicence) {
  const std::string picture = readHostFile(appFile("Pictures/Face.png"));
  ASSERT_TRUE(demote("com.a").ok());
  const auto app = device_.record("com.a");
  EXPECT_FALSE(app->isInstalled());
  EXPECT_TRUE(app->isPlaceholder());
  EXPECT_EQ(app->installType(), TSInstallType::IntentionalDowngrade);
  EXPECT_EQ(app->bundleVersion(), "3.1");
  EXPECT_EQ(app->installProgress(), nullptr);
  EXPECT_EQ(readHostFile(appFile("Icon.png")), picture);
  EXPECT_FALSE(std::filesystem::exists(appFile("data")));
  const std::string container = device_.host(*app->bundleContainerPath());
  EXPECT_EQ(readHostFile(container + "/HarvoMetadata.plist"), "{title = Notes;}");
  EXPECT_EQ(readHostFile(container + "/HarvoArtwork"), "artwork");
  const auto bundle = device_.services().bundles().openBundle({*app->bundlePath(), true});
  EXPECT_EQ(bundle->infoDictionaryValue("BundleDisplayName")->string(), "Notes");
  EXPECT_EQ(plist::truth(*bundle->infoDictionaryValue("UIPeriodixApp")), true);
  EXPECT_EQ(device_.registry().licenceData("com.a").value(), kLicence);
  EXPECT_EQ(device_.containers(), 1);
}

TEST_F(Demotion, IgnoresIconOutsideApp) {
  writeHostFile(appFile("Info.plist"), R"({BundleIdentifier = "com.a"; BundleIconFile = "../HarvoMetadata.plist";})");
  ASSERT_TRUE(demote("com.a").ok());
  EXPECT_TRUE(fs::exists(appFile("Info.plist")));
  EXPECT_FALSE(fs::exists(appFile("Icon.png")));
}

TEST_F(Demotion, PlaceholderCanBeRenamed) {
  EXPECT_FALSE(device_.registry().renamePlaceholder("com.a", "Other").ok()) << "it is installed";
  ASSERT_TRUE(demote("com.a").ok());
  ASSERT_TRUE(device_.registry().renamePlaceholder("com.a", "Other").ok());
  device_.reopen();
  const auto app = device_.record("com.a");
  const auto bundle = device_.services().bundles().openBundle({*app->bundlePath(), true});
  EXPECT_EQ(bundle->infoDictionaryValue("BundleDisplayName")->string(), "Other");
  EXPECT_EQ(bundle->infoDictionaryValue("BundleVersion")->string(), "3.1");
  EXPECT_EQ(device_.registry().apps()->front()->name(), "Other");
  EXPECT_FALSE(device_.registry().renamePlaceholder("com.none", "Other").ok());
}

TEST_F(Demotion, KeepsDataAndSurvivesRestart) {
  std::filesystem::create_directories(device_.host(device::dataContainerOf("com.a")));
  ASSERT_TRUE(demote("com.a").ok());
  device_.reopen();
  EXPECT_TRUE(std::filesystem::exists(device_.host(device::dataContainerOf("com.a"))));
  EXPECT_EQ(device_.record("com.a")->installType(), TSInstallType::IntentionalDowngrade);
  EXPECT_EQ(device_.record("com.a")->installProgress(), nullptr);
}

TEST_F(Demotion, IsNotARemoval) {
  ASSERT_TRUE(demote("com.a").ok());
  const auto uninstalled = device_.services().uninstalledApps().lookupUninstalled();
  EXPECT_TRUE(!uninstalled || uninstalled->empty());
}

TEST_F(Demotion, ListContainsDemotedAppsByType) {
  device_.install("com.b");
  device_.install("com.c");
  ASSERT_TRUE(demote("com.a").ok());
  ASSERT_TRUE(demote("com.b", TSInstallType::Downgrade).ok());
  EXPECT_THAT(listed("IntentionalDowngrades"), ElementsAre("com.a"));
  EXPECT_THAT(listed("AutomaticDowngrades"), ElementsAre("com.b"));
  device_.install("com.a");
  ASSERT_TRUE(demote("com.c").ok());
  EXPECT_THAT(listed("IntentionalDowngrades"), ElementsAre("com.c"));
}

TEST_F(Demotion, InstallKeepsDataAndLicence) {
  std::filesystem::create_directories(device_.host(device::dataContainerOf("com.a")));
  ASSERT_TRUE(demote("com.a").ok());
  device_.install("com.a", "3.2");
  EXPECT_TRUE(device_.record("com.a")->isInstalled());
  EXPECT_FALSE(device_.record("com.a")->isPlaceholder());
  EXPECT_TRUE(std::filesystem::exists(device_.host(device::dataContainerOf("com.a"))));
  EXPECT_EQ(device_.registry().licenceData("com.a").value(), kLicence);
}

TEST_F(Demotion, RejectsAppThatIsNotInstalled) {
  EXPECT_THAT(demote("com.none").error().text, HasSubstr("there is no app \"com.none\" to demote"));
  device_.placeholder("com.b");
  EXPECT_THAT(demote("com.b").error().text, HasSubstr("there is no app \"com.b\" to demote"));
  ASSERT_TRUE(demote("com.a").ok());
  EXPECT_FALSE(demote("com.a").ok());
}

TEST_F(Demotion, RejectsAppBeingUpdated) {
  device_.placeholder("com.a");
  EXPECT_THAT(demote("com.a").error().text, HasSubstr("is being updated"));
  EXPECT_TRUE(device_.record("com.a")->isInstalled());
}

TEST_F(Demotion, CanBeRevertedBeforePackageArrives) {
  ASSERT_TRUE(demote("com.a").ok());
  ASSERT_TRUE(device_.registry().setPlaceholderType("com.a", TSInstallType::Restore).ok());
  EXPECT_EQ(device_.record("com.a")->installType(), TSInstallType::Restore);
  ASSERT_NE(device_.record("com.a")->installProgress(), nullptr);
  ASSERT_TRUE(device_.registry().setPlaceholderType("com.a", TSInstallType::Downgrade).ok());
  EXPECT_EQ(device_.record("com.a")->installType(), TSInstallType::Downgrade);
  EXPECT_EQ(device_.record("com.a")->installProgress(), nullptr);
}

TEST_F(Demotion, OnlyPlaceholderWithoutAppChangesType) {
  EXPECT_FALSE(device_.registry().setPlaceholderType("com.a", TSInstallType::Downgrade).ok());
  EXPECT_FALSE(device_.registry().setPlaceholderType("com.none", TSInstallType::Downgrade).ok());
  EXPECT_EQ(device_.record("com.a")->installType(), TSInstallType::None);
}

TEST(DemotionKill, IsAtomic) {
  killAtEveryStep(
      [](TestDevice& device) { device.install("com.a"); },
      [](TestDevice& device) {
        EXPECT_TRUE(
            device::demote(device.registry(), device.files(), "com.a", TSInstallType::IntentionalDowngrade).ok());
      },
      [](TestDevice& device) {
        const std::string version = versionOf(device, "com.a");
        EXPECT_TRUE(version == "1.0" || version == "1.0 placeholder") << version;
        EXPECT_EQ(device.record("com.a")->isInstalled(), version == "1.0");
      });
}

}  // namespace
}  // namespace appsync::test
