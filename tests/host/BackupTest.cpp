#include <chrono>
#include <filesystem>

#include <gmock/gmock.h>
#include <sys/stat.h>

#include "host/Backup.h"
#include "host/BackupCheck.h"
#include "tests/host/BackupFixture.h"
#include "tests/support/KilledTool.h"

namespace appsync::test {
namespace {

using host::BackedUpApp;
using platform::TSInstallType;
using testing::HasSubstr;
using testing::UnorderedElementsAre;

class Backup : public BackupFixture {
 protected:
  [[nodiscard]] BackedUpApp entry(const std::string& identifier) const {
    const auto read = host::readBackup(backup());
    EXPECT_TRUE(read.ok());
    for (const BackedUpApp& app : read->apps) {
      if (app.name.identifier == identifier) return app;
    }
    ADD_FAILURE() << identifier << " is not in the backup";
    return {};
  }
  [[nodiscard]] std::string file(const std::string& name) const { return readHostFile(backup() + "/Apps/" + name); }
  /// Sets this file as the icon in the info dictionary of every installed app.
  void nameIcons(const std::string& icon) const {
    const auto opened = device::Device::open(device(), device::Access::readOnly);
    const auto apps = (*opened)->services().defaultRegistry().apps();
    for (const auto& app : *apps) {
      write(device() + "/root" + *app->bundlePath() + "/Info.plist",
            "{BundleIdentifier = \"" + app->applicationIdentifier() + "\"; BundleIconFile = \"" + icon + "\";}");
    }
  }
  /// Returns the names in the parent folder of the backup.
  [[nodiscard]] std::vector<std::string> names() const {
    std::vector<std::string> names;
    for (const auto& entry : std::filesystem::directory_iterator(path("")))
      names.push_back(entry.path().filename());
    return names;
  }
};

TEST_P(Backup, SavesEverythingARestoreNeeds) {
  fillDevice();
  const Finished saved = run({"backup", device(), backup()});
  EXPECT_THAT(saved.out, HasSubstr("Saved 5 apps, 2 demoted, 2 with data, to "));
  EXPECT_EQ(entry("org.data").name.version, "2.0");
  EXPECT_EQ(entry("org.data").data, 16U);
  EXPECT_EQ(file("org.data/Data/Documents/notes"), "what was written");
  EXPECT_THAT(file("org.data/HarvoMetadata.plist"), HasSubstr("With Data"));
  EXPECT_EQ(file("org.licence/ApplicationSINF"), "a licence");
  EXPECT_EQ(entry("org.wished").demotion, TSInstallType::IntentionalDowngrade);
  EXPECT_EQ(entry("org.auto").demotion, TSInstallType::Downgrade);
  EXPECT_EQ(file("org.auto/Data/Documents/scores"), "100");
  EXPECT_FALSE(entry("org.plain").isDemoted());
  EXPECT_FALSE(entry("org.plain").data);
}

TEST_P(Backup, EmptyDeviceResultsInEmptyBackup) {
  EXPECT_THAT(run({"backup", device(), backup()}).out, HasSubstr("Saved 0 apps"));
  EXPECT_TRUE(host::readBackup(backup())->apps.empty());
}

TEST_P(Backup, RefusesExistingPath) {
  write(path("file"), "mine");
  EXPECT_THAT(run({"backup", device(), path("file")}, 3).err, HasSubstr("already exists; choose another name"));
  EXPECT_EQ(readHostFile(path("file")), "mine");
  makeBackup();
  EXPECT_THAT(run({"backup", device(), backup()}, 3).err, HasSubstr("already exists"));
  EXPECT_THAT(run({"backup", device(), backup() + "/"}, 3).err, HasSubstr("already exists"));
  EXPECT_THAT(run({"backup", device(), "."}, 3).err, HasSubstr("already exists"));
}

TEST_P(Backup, RefusesMissingParentOrDevice) {
  EXPECT_THAT(run({"backup", device(), path("missing/backup")}, 3).err, HasSubstr("missing"));
  EXPECT_THAT(run({"backup", library(), backup()}, 3).err, HasSubstr("is not a device"));
  EXPECT_FALSE(std::filesystem::exists(backup()));
}

TEST_P(Backup, OmitsAndReportsSpecialFiles) {
  fillDevice();
  const std::string data = device() + kData + "org.data/";
  ASSERT_EQ(mkfifo((data + "pipe").c_str(), 0600), 0);
  const Finished saved = run({"backup", device(), backup()});
  EXPECT_EQ(saved.err, "appsync: the data of org.data is saved without 1 item that is not a file, folder or link\n");
  EXPECT_THAT(saved.out, HasSubstr("Saved 5 apps, 2 demoted, 2 with data, to "));
  EXPECT_FALSE(std::filesystem::exists(backup() + "/Apps/org.data/Data/pipe"));
  EXPECT_EQ(file("org.data/Data/Documents/notes"), "what was written");

  std::filesystem::remove_all(backup());
  ASSERT_EQ(mknod((data + "Documents/socket").c_str(), S_IFSOCK | 0600, 0), 0);
  EXPECT_EQ(run({"backup", device(), backup()}).err,
            "appsync: the data of org.data is saved without 2 items that are not files, folders or links\n");
}

TEST_P(Backup, KeepsPermissionsAndTimesOfData) {
  fillDevice();
  namespace fs = std::filesystem;
  const std::string data = device() + kData + "org.data/Documents";
  const auto before = fs::file_time_type::clock::now() - std::chrono::hours(1000);
  fs::permissions(data + "/notes", fs::perms::owner_read | fs::perms::group_write);
  fs::permissions(data, fs::perms::owner_all | fs::perms::others_exec);
  fs::last_write_time(data + "/notes", before);
  fs::last_write_time(data, before);
  makeBackup();
  makeNewDevice();
  EXPECT_EQ(restore().status, 0);
  for (const std::string& copy : {backup() + "/Apps/org.data/Data/Documents",
                                  newDevice() + "/root/var/mobile/Library/Vaultory/RestoreData/org.data/Documents"}) {
    EXPECT_EQ(fs::status(copy + "/notes").permissions(), fs::perms::owner_read | fs::perms::group_write) << copy;
    EXPECT_EQ(fs::status(copy).permissions(), fs::perms::owner_all | fs::perms::others_exec) << copy;
    EXPECT_EQ(fs::last_write_time(copy + "/notes"), before) << copy;
    EXPECT_EQ(fs::last_write_time(copy), before) << copy;
  }
}

TEST_P(Backup, IgnoresForeignAndLargeIcons) {
  publish("org.inside");
  publish("org.large");
  publish("org.outside", "1.0", {{"HarvoMetadata.plist", "{}"}});
  ASSERT_EQ(sync().status, 0);
  const auto name = [&](const std::string& identifier, const std::string& icon) {
    const auto opened = device::Device::open(device(), device::Access::readOnly);
    const auto app =
        (*opened)->services().defaultRegistry().recordForIdentifier(identifier, platform::PlaceholderLookup::on);
    const std::string bundle = device() + "/root" + *app->bundlePath();
    write(bundle + "/Info.plist", "{BundleIdentifier = \"" + identifier + "\"; BundleIconFile = \"" + icon + "\";}");
    return bundle;
  };
  const std::string picture = readHostFile(name("org.inside", "Icon.png") + "/Icon.png");
  name("org.outside", "../HarvoMetadata.plist");
  std::filesystem::resize_file(name("org.large", "Icon.png") + "/Icon.png", (8U << 20) + 1);
  makeBackup();
  EXPECT_FALSE(picture.empty());
  EXPECT_EQ(file("org.inside/PlaceholderIcon"), picture);
  EXPECT_FALSE(entry("org.outside").icon);
  EXPECT_FALSE(entry("org.large").icon);
}

TEST_P(Backup, DoesNotFollowLinksInData) {
  fillDevice();
  write(path("secret"), "secret");
  std::filesystem::create_symlink(path("secret"), device() + kData + "org.data/link");
  std::filesystem::create_symlink(path(""), device() + kData + "org.plain");
  run({"backup", device(), backup()}, 3);
  std::filesystem::remove(device() + kData + "org.plain");
  makeBackup();
  EXPECT_TRUE(std::filesystem::is_symlink(backup() + "/Apps/org.data/Data/link"));
}

TEST_P(Backup, IsAtomicWhenKilledAtAnyStep) {
  fillDevice();
  killAtEachStep(
      5, 30, [this] { std::filesystem::remove_all(backup()); },
      [this](const ToolOptions& options) {
        return runTool({"backup", device(), backup()}, options);
      },
      [this] {
        const bool isComplete = std::filesystem::exists(backup());
        if (!isComplete) makeBackup();
        ASSERT_EQ(host::readBackup(backup())->apps.size(), 5U);
        EXPECT_TRUE(isComplete || names().size() == 4) << "something else than the backup is left";
      });
}

TEST_P(Backup, RestoresAppsThatShareOneIcon) {
  constexpr int kApps = 34;
  const std::string icon(262'144, 'i');
  for (int app = 0; app < kApps; ++app)
    publish("org.app" + std::to_string(app), "1.0", {{"Notes.app/Picture.png", icon}});
  ASSERT_EQ(sync().status, 0);
  nameIcons("Picture.png");
  EXPECT_THAT(run({"backup", device(), backup()}).out, HasSubstr("Saved 34 apps"));
  EXPECT_EQ(entry("org.app0").icon, icon.size());
  makeNewDevice();
  const Finished restored = restore();
  EXPECT_EQ(restored.status, 0) << restored.err << restored.out;
  EXPECT_EQ(newApps().size(), std::size_t{kApps});
}

TEST_P(Backup, CheckFindsDamage) {
  fillDevice();
  makeBackup();
  const auto written = host::readBackup(backup());
  ASSERT_TRUE(written.ok());
  const auto problem = [&] {
    const Status checked = host::checkBackup(backup(), *written);
    return checked ? std::string() : checked.error().text;
  };
  EXPECT_EQ(problem(), "");
  const auto finds = [&](const std::string& name, const std::string& content, const std::string& text) {
    const std::string before = readHostFile(backup() + "/" + name);
    write(backup() + "/" + name, content);
    EXPECT_THAT(problem(), HasSubstr(text)) << name;
    write(backup() + "/" + name, before);
  };
  finds("Apps/org.plain/PlaceholderIcon", "cut", "must have 9");
  finds("Apps/org.licence/ApplicationSINF", "", "must have 9");
  finds("Apps/org.data/HarvoMetadata.plist", "", "is damaged");
  finds("Apps/org.data/Data/Documents/notes", "less", "the data of org.data has 4 bytes and must have 16");
  finds("Manifest.plist", "", "is not a usable backup");
  finds("Manifest.plist", std::string(textOf(*plist::writeXML(host::manifestOf({backup(), "other", {}, {}})))),
        "its manifest differs from what was written");
  EXPECT_EQ(problem(), "");
  std::filesystem::remove_all(backup() + "/Apps/org.auto/Data");
  EXPECT_THAT(problem(), HasSubstr("org.auto/Data"));
}

INSTANTIATE_TEST_SUITE_P(Modes, Backup, kModes, nameOfMode);

}  // namespace
}  // namespace appsync::test
