#include <csignal>
#include <functional>

#include <gmock/gmock.h>

#include "host/Backup.h"
#include "tests/host/BackupFixture.h"
#include "tests/support/KilledTool.h"

namespace appsync::test {
namespace {

using testing::Contains;
using testing::ElementsAre;
using testing::HasSubstr;
using testing::Not;
using testing::UnorderedElementsAre;

class Restore : public BackupFixture {
 protected:
  void prepare() {
    fillDevice();
    makeBackup();
    makeNewDevice();
  }
  [[nodiscard]] bool isCoordinated() const { return GetParam() == std::string("--coordinated"); }
  [[nodiscard]] std::string manifest() const { return readHostFile(backup() + "/Manifest.plist"); }
  void changeManifest(const std::string& from, const std::string& to) const {
    std::string text = manifest();
    ASSERT_NE(text.find(from), std::string::npos);
    write(backup() + "/Manifest.plist", text.replace(text.find(from), from.size(), to));
  }
  /// Kills `work` on copies of the new device. Expects `resume` and a sync to complete each.
  void killAtEachStepOfNewDevice(long least, const std::function<Finished(const ToolOptions&)>& work,
                                 const std::function<void()>& resume) const {
    std::filesystem::rename(newDevice(), path("original"));
    const auto reset = [this] {
      std::filesystem::remove_all(newDevice());
      std::filesystem::copy(path("original"), newDevice(), std::filesystem::copy_options::recursive);
    };
    killAtEachStep(9, least, reset, work, [&] {
      resume();
      ASSERT_EQ(syncNew().status, 0);
      ASSERT_EQ(contentOf(newDevice()), contentOf(device()));
    });
  }
  [[nodiscard]] std::string newFile(const std::string& devicePath) const { return newDevice() + "/root" + devicePath; }
};

TEST_P(Restore, SyncCompletesRestoredDevice) {
  prepare();
  const Finished restored = restore();
  EXPECT_EQ(restored.status, 0) << restored.err;
  EXPECT_THAT(restored.out, HasSubstr("5 restored."));
  EXPECT_THAT(newApps(),
              ElementsAre("org.auto 3.0?", "org.data 2.0?", "org.licence 1.0?", "org.plain 1.0?", "org.wished 1.0?"));
  const Finished synced = syncNew();
  EXPECT_EQ(synced.status, 0) << synced.err;
  EXPECT_THAT(synced.out, HasSubstr("3 installed, 2 skipped."));
  EXPECT_EQ(contentOf(newDevice()), contentOf(device()));
  EXPECT_FALSE(std::filesystem::exists(newDevice() + "/restore.plist"));
  EXPECT_EQ(syncNew().status, 0);
  EXPECT_EQ(contentOf(newDevice()), contentOf(device()));
}

TEST_P(Restore, ReportsEachAppOnceInJson) {
  prepare();
  const Finished restored = restore({"--json"});
  EXPECT_THAT(endsIn(restored.out),
              UnorderedElementsAre("restored org.auto", "restored org.data", "restored org.licence",
                                   "restored org.plain", "restored org.wished"));
  const cli::Json summary = eventsIn(restored.out).back();
  EXPECT_EQ(summary.at("event"), "summary");
  EXPECT_EQ(summary.at("restored").size(), 5U);
  EXPECT_EQ(summary.at("failed"), cli::Json::array());
  EXPECT_EQ(summary.at("skipped"), cli::Json::array());
  EXPECT_FALSE(summary.contains("installed"));
}

TEST_P(Restore, LogsAndArchivesTheRestoreFile) {
  prepare();
  ASSERT_EQ(restore({"--log", path("log")}).status, 0);
  const std::string log = readHostFile(path("log"));
  EXPECT_THAT(log, HasSubstr("|reconcileRestoreOfType 2"));
  EXPECT_THAT(log, HasSubstr(" placeholders to install"));
  EXPECT_THAT(log, HasSubstr("|Finished waiting for placeholder installs"));
  EXPECT_FALSE(std::filesystem::exists(newFile("/var/mobile/Media/HarvoRestore/RestoreApplications.plist")));
  EXPECT_TRUE(std::filesystem::exists(newFile("/var/mobile/Library/Logs/MediaServices/RestoreApplications.plist")));
}

TEST_P(Restore, KeepsDataUntilPackageIsInstalled) {
  prepare();
  ASSERT_EQ(restore().status, 0);
  EXPECT_FALSE(std::filesystem::exists(newDevice() + kData + "org.data"));
  EXPECT_EQ(readHostFile(newDevice() + kData + "org.auto/Documents/scores"), "100");
  ASSERT_EQ(syncNew().status, 0);
  EXPECT_EQ(readHostFile(newDevice() + kData + "org.data/Documents/notes"), "what was written");
}

TEST_P(Restore, BacksUpDeviceBeforePackagesArrive) {
  prepare();
  ASSERT_EQ(restore().status, 0);
  run({"backup", newDevice(), path("second")});
  const auto second = host::readBackup(path("second"));
  EXPECT_EQ(second->apps.size(), 5U);
  EXPECT_EQ(readHostFile(path("second/Apps/org.data/Data/Documents/notes")), "what was written");
  EXPECT_EQ(readHostFile(path("second/Apps/org.licence/ApplicationSINF")), "a licence");
}

TEST_P(Restore, ReinstallsDemotedAppWithData) {
  prepare();
  ASSERT_EQ(restore().status, 0);
  const Finished synced = syncNew({"--only", "org.auto"});
  EXPECT_EQ(synced.status, 0) << synced.err;
  EXPECT_THAT(newApps(), Contains("org.auto 3.0"));
  EXPECT_EQ(readHostFile(newDevice() + kData + "org.auto/Documents/scores"), "100");
}

TEST_P(Restore, MissingPackageFailsUntilProvided) {
  prepare();
  ASSERT_EQ(restore().status, 0);
  std::filesystem::rename(library() + "/org.plain-1.0.zip", path("aside"));
  const Finished without = syncNew();
  EXPECT_EQ(without.status, 1);
  EXPECT_THAT(without.err, HasSubstr("org.plain"));
  EXPECT_THAT(newApps(), Contains("org.plain 1.0?"));
  std::filesystem::rename(path("aside"), library() + "/org.plain-1.0.zip");
  EXPECT_EQ(syncNew().status, 0);
  EXPECT_EQ(contentOf(newDevice()), contentOf(device()));
}

TEST_P(Restore, OnlyCoordinatedAppsNeedAStore) {
  prepare();
  run({"set", newDevice(), "store=unset"});
  ASSERT_EQ(restore().status, 0);
  const Finished synced = syncNew();
  EXPECT_EQ(synced.status, isCoordinated() ? 1 : 0);
  if (isCoordinated()) {
    EXPECT_THAT(synced.err, HasSubstr("`appsync set DEVICE store=FOLDER`"));
  }
  run({"set", newDevice(), "store=" + library()});
  EXPECT_EQ(syncNew().status, 0);
  EXPECT_EQ(contentOf(newDevice()), contentOf(device()));
}

TEST_P(Restore, RefusesDeviceWithApps) {
  fillDevice();
  makeBackup();
  const Finished refused = runTool({"restore", device(), backup()});
  EXPECT_EQ(refused.status, 3);
  EXPECT_THAT(refused.err, HasSubstr("already has apps; restore to a new device"));
  EXPECT_FALSE(std::filesystem::exists(device() + "/restore.plist"));
}

TEST_P(Restore, RefusesInvalidBackup) {
  prepare();
  const auto refusal = [this] {
    const Finished refused = restore();
    EXPECT_EQ(refused.status, 3);
    EXPECT_THAT(newApps(), ElementsAre());
    return refused.err;
  };
  const std::string good = manifest();
  changeManifest("appsync backup", "holiday pictures");
  EXPECT_THAT(refusal(), HasSubstr("its manifest is not that of a backup"));
  write(backup() + "/Manifest.plist", good);
  changeManifest("<integer>1</integer>", "<integer>9</integer>");
  EXPECT_THAT(refusal(), HasSubstr("it has version 9 and this program reads version 1"));
  write(backup() + "/Manifest.plist", good.substr(0, good.size() / 2));
  EXPECT_THAT(refusal(), HasSubstr("its manifest is damaged"));
  write(backup() + "/Manifest.plist", "");
  EXPECT_THAT(refusal(), HasSubstr("is not a usable backup"));
  std::filesystem::remove(backup() + "/Manifest.plist");
  EXPECT_THAT(refusal(), HasSubstr("is not a usable backup"));
  EXPECT_EQ(runTool({"restore", newDevice(), path("missing")}).status, 3);
  EXPECT_EQ(runTool({"restore", newDevice(), path("licence")}).status, 3);
}

TEST_P(Restore, DamagedFilesFailOnlyTheirApp) {
  prepare();
  write(backup() + "/Apps/org.data/Data/Documents/notes", "less");
  write(backup() + "/Apps/org.licence/ApplicationSINF", "x");
  std::filesystem::remove(backup() + "/Apps/org.wished/HarvoMetadata.plist");
  std::filesystem::remove_all(backup() + "/Apps/org.auto/Data");
  const Finished restored = restore({"--json"});
  EXPECT_EQ(restored.status, 1);
  EXPECT_THAT(endsIn(restored.out), UnorderedElementsAre("failed org.auto", "failed org.data", "failed org.licence",
                                                         "restored org.plain", "restored org.wished"));
  EXPECT_THAT(restored.out, HasSubstr("its data in the backup is damaged: it has 4 bytes and must have 16"));
  EXPECT_THAT(restored.out, HasSubstr("ApplicationSINF is damaged: it has 1 bytes and must have 9"));
  EXPECT_THAT(newApps(), ElementsAre("org.plain 1.0?", "org.wished 1.0?"));
}

TEST_P(Restore, NonDictionaryMetadataFailsItsApp) {
  fillDevice();
  publish("org.odd", "1.0", {{"HarvoMetadata.plist", "(a, b)"}});
  ASSERT_EQ(sync({"--only", "org.odd"}).status, 0);
  makeBackup();
  makeNewDevice();
  const Finished restored = restore();
  EXPECT_EQ(restored.status, 1);
  EXPECT_THAT(restored.err, HasSubstr("its store metadata is damaged: it is not a dictionary"));
  EXPECT_EQ(newApps().size(), 5U);
}

TEST_P(Restore, RefusesHostileIdentifiers) {
  prepare();
  write(path("escaped"), "untouched");
  for (const char* identifier : {"../../escaped", "/etc", "..", ""}) {
    makeNewDevice();
    const std::string good = manifest();
    changeManifest("<string>org.plain</string>", "<string>" + std::string(identifier) + "</string>");
    const Finished restored = restore();
    EXPECT_EQ(restored.status, 1) << identifier;
    EXPECT_THAT(restored.err, HasSubstr("is not a bundle identifier")) << identifier;
    EXPECT_EQ(newApps().size(), 4U) << identifier;
    write(backup() + "/Manifest.plist", good);
  }
  EXPECT_EQ(readHostFile(path("escaped")), "untouched");
}

TEST_P(Restore, ResumesOnlyWithTheSameBackup) {
  prepare();
  run({"backup", device(), path("other")});
  long step = 1;
  // Killed as soon as there are apps.
  while (newApps().empty()) {
    makeNewDevice();
    step += 10;
    ASSERT_EQ(restore({}, killedAt(step)).status, -SIGKILL);
  }
  const Finished other = runTool({"restore", newDevice(), path("other")});
  EXPECT_EQ(other.status, 3);
  EXPECT_THAT(other.err, HasSubstr("has an unfinished restore of another backup"));
  EXPECT_EQ(restore().status, 0);
  EXPECT_EQ(newApps().size(), 5U);
  EXPECT_EQ(runTool({"restore", newDevice(), backup()}).status, 3);
}

TEST_P(Restore, DemotedAppKeepsItsOwnName) {
  publish("org.wished", "1.0", {{"HarvoMetadata.plist", "{title = \"The Best of Wishes\";}"}});
  ASSERT_EQ(sync().status, 0);
  run({"set", device(), "demote=org.wished"});
  const auto nameOn = [](const std::string& device) {
    return std::string(cli::Json::parse(run({"apps", device, "--json"}).out).at(0).at("name"));
  };
  const std::string name = nameOn(device());
  makeBackup();
  makeNewDevice();
  ASSERT_EQ(restore().status, 0);
  EXPECT_EQ(nameOn(newDevice()), name);
  EXPECT_NE(name, "The Best of Wishes");
}

TEST_P(Restore, ResumesWhenKilledAtAnyStep) {
  prepare();
  // Every killed restore is unfinished: the last step removes its marker.
  killAtEachStepOfNewDevice(
      100, [this](const ToolOptions& options) { return restore({}, options); },
      [this] { ASSERT_EQ(restore().status, 0); });
}

TEST_P(Restore, NextSyncResumesKilledSync) {
  prepare();
  ASSERT_EQ(restore().status, 0);
  killAtEachStepOfNewDevice(
      50, [this](const ToolOptions& options) { return syncNew({}, options); }, [] {});
}

INSTANTIATE_TEST_SUITE_P(Modes, Restore, kModes, nameOfMode);

class DemotionCommand : public ToolFixture {};

TEST_F(DemotionCommand, DemotesInstalledApp) {
  publish("org.a");
  ASSERT_EQ(sync().status, 0);
  EXPECT_EQ(runTool({"set", device(), "demote=org.a"}).status, 0);
  EXPECT_THAT(runTool({"apps", device()}).out, HasSubstr("demoted"));
  const Finished synced = sync();
  EXPECT_EQ(synced.status, 0);
  EXPECT_THAT(synced.out, HasSubstr("it is demoted"));
  EXPECT_EQ(sync({"--only", "org.a"}).status, 0);
  EXPECT_THAT(runTool({"apps", device()}).out, Not(HasSubstr("demoted")));
}

TEST_F(DemotionCommand, RefusesUnknownApps) {
  const Finished refused = runTool({"set", device(), "demote=org.none"});
  EXPECT_EQ(refused.status, 2);
  EXPECT_THAT(refused.err, HasSubstr("there is no app \"org.none\" to demote"));
  EXPECT_EQ(runTool({"set", device(), "demote-auto=org.none"}).status, 2);
  EXPECT_EQ(runTool({"set", device(), "licence=org.none"}).status, 2);
  write(path("licence"), "x");
  EXPECT_EQ(runTool({"set", device(), "licence=org.none:" + path("licence")}).status, 2);
  EXPECT_EQ(runTool({"set", device(), "licence=org.none:" + path("missing")}).status, 3);
}

}  // namespace
}  // namespace appsync::test
