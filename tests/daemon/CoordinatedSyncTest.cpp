// Syncs of a device that installs through coordinators.
#include <algorithm>
#include <csignal>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <map>

#include <gmock/gmock.h>

#include "tests/support/SyncInThisProcess.h"
#include "tests/support/ToolFixture.h"

namespace appsync::test {

namespace {

namespace fs = std::filesystem;
using testing::AnyOf;
using testing::Contains;
using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;
using testing::StartsWith;
using testing::UnorderedElementsAre;

std::string contentOf(const fs::path& path) {
  std::ifstream file(path, std::ios::binary);
  return {std::istreambuf_iterator<char>(file), {}};
}

class EitherMode : public ToolFixture {
 protected:
  /// Returns every file below the device's root, except those with times, without the names of containers.
  [[nodiscard]] std::map<std::string, std::string> files() const {
    std::map<std::string, std::string> files;
    const fs::path root = device() + "/root";
    const fs::path containers = root / "var/mobile/Containers/Bundle";
    for (const auto& entry : fs::recursive_directory_iterator(root)) {
      if (!entry.is_regular_file()) continue;
      fs::path path = fs::relative(entry.path(), root);
      if (const fs::path inside = fs::relative(entry.path(), containers); *inside.begin() != "..") {
        fs::path below;
        for (auto part = std::next(inside.begin()); part != inside.end(); ++part)
          below /= *part;
        path = fs::path("Bundle") / identifierOf(containers / *inside.begin()) / below;
      }
      files[path] = contentOf(entry.path());
    }
    return files;
  }
  /// Runs syncs with installs, updates, removals and a damaged package.
  void live(const std::string& mode) {
    fs::remove_all(device());
    ASSERT_EQ(runTool({"init", device(), mode}).status, 0);
    fs::remove_all(library());
    fs::create_directory(library());
    for (const char* identifier : {"org.a", "org.b", "org.c"})
      publish(identifier);
    ASSERT_EQ(sync().status, 0);
    publish("org.b", "2.0", {{"HarvoMetadata.plist", infoPlist("org.b")}});
    publish("org.d");
    publish("org.bad", "1.0", {{"Notes.app/torn", "x", S_IFREG | 0644, false, true}});
    ASSERT_EQ(sync({"--remove", "org.a"}).status, 1);
    fs::remove(library() + "/org.bad-1.0.zip");
    ASSERT_EQ(sync().status, 0);
  }

 private:
  [[nodiscard]] static std::string identifierOf(const fs::path& container) {
    const Finished info = runTool({"plist", (container / "Notes.app/Info.plist").string(), "--to", "json"});
    return cli::Json::parse(info.out).value("BundleIdentifier", "");
  }
};

TEST_F(EitherMode, BothModesResultInTheSameDevice) {
  live("--direct");
  const auto directFiles = files();
  const std::string directApps = runTool({"apps", device(), "--json"}).out;
  const std::string directHost = contentOf(device() + "/host-state.plist");
  live("--coordinated");
  EXPECT_EQ(runTool({"apps", device(), "--json"}).out, directApps);
  EXPECT_EQ(contentOf(device() + "/host-state.plist"), directHost);
  EXPECT_EQ(files(), directFiles);
}

TEST_F(EitherMode, ModeCanBeChanged) {
  publish("org.a");
  ASSERT_EQ(runTool({"set", device(), "coordination=off"}).status, 0);
  ASSERT_EQ(sync().status, 0);
  ASSERT_EQ(runTool({"set", device(), "coordination=on"}).status, 0);
  publish("org.a", "2.0");
  EXPECT_THAT(endsIn(sync({"--json"}).out), ElementsAre("updated org.a"));
  EXPECT_THAT(apps(), ElementsAre("org.a 2.0"));
}

class CoordinatedSync : public ToolFixture {
 protected:
  [[nodiscard]] std::vector<std::string> coordinators() const {
    const auto device = device::Device::open(this->device(), device::Access::readOnly);
    std::vector<std::string> identifiers;
    const auto list = (*device)->services().installCoordination().list();
    for (const auto& coordinator : *list)
      identifiers.push_back(coordinator.identifier);
    return identifiers;
  }
};

TEST_F(CoordinatedSync, LeavesNoCoordinator) {
  publish("org.a");
  publish("org.bad", "1.0", {{"Notes.app/torn", "x", S_IFREG | 0644, false, true}});
  ASSERT_EQ(sync().status, 1);
  EXPECT_THAT(coordinators(), IsEmpty());
  EXPECT_THAT(apps(), ElementsAre("org.a 1.0"));
}

TEST_F(CoordinatedSync, OtherProcessesSeeProgress) {
  for (const char* identifier : {"org.a", "org.b"})
    publish(identifier);
  StepHold hold("send package", 1);
  SyncInThisProcess sync(device(), library());
  hold.waitUntilHeld();
  sync.waitUntilTold();
  EXPECT_THAT(apps(), UnorderedElementsAre("org.a 1.0?", "org.b 1.0?"));
  EXPECT_EQ(runTool({"screen", device(), "-o", path("screen.png")}).status, 0);
  EXPECT_TRUE(fs::exists(path("screen.png")));
  const auto reader = device::Device::open(device(), device::Access::readOnly);
  ASSERT_TRUE(reader.ok());
  device::AppRegistry& registry = (*reader)->services().defaultRegistry();
  for (const char* identifier : {"org.a", "org.b"}) {
    const auto record = registry.recordForIdentifier(identifier, platform::PlaceholderLookup::on);
    ASSERT_TRUE(record);
    EXPECT_TRUE(record->installProgress()) << identifier;
  }
}

TEST_F(CoordinatedSync, RefusesSecondProcess) {
  publish("org.a");
  StepHold hold("send package", 1);
  SyncInThisProcess first(device(), library());
  hold.waitUntilHeld();
  const Finished second = sync();
  EXPECT_EQ(second.status, 3);
  EXPECT_THAT(second.err, HasSubstr("another process"));
}

TEST_F(CoordinatedSync, KilledSyncOfLostPackageLeavesNothing) {
  publish("org.a");
  publish("org.gone");
  fs::copy(device(), path("original"), fs::copy_options::recursive);
  fs::copy(library(), path("full"), fs::copy_options::recursive);
  int kills = 0;
  for (int step = 20;; step += 20, ++kills) {
    fs::remove_all(device());
    fs::copy(path("original"), device(), fs::copy_options::recursive);
    fs::copy(path("full"), library(), fs::copy_options::recursive | fs::copy_options::overwrite_existing);
    const Finished killed = sync({}, killedAt(step));
    if (killed.status == 0) break;
    ASSERT_EQ(killed.status, -SIGKILL);
    fs::remove(library() + "/org.gone-1.0.zip");
    ASSERT_EQ(sync().status, 0) << "step " << step;
    EXPECT_THAT(coordinators(), IsEmpty()) << "step " << step;
    // The package may have been sent before the kill; the app is then installed.
    EXPECT_THAT(apps(), AnyOf(ElementsAre("org.a 1.0"), UnorderedElementsAre("org.a 1.0", "org.gone 1.0")))
        << "step " << step;
  }
  EXPECT_GT(kills, 3);
}

TEST_F(CoordinatedSync, VanishedPackageFailsItsApp) {
  publish("org.a");
  publish("org.b");
  StepHold hold("send package", 1);
  SyncInThisProcess sync(device(), library());
  hold.waitUntilHeld();
  fs::remove(library() + "/org.b-1.0.zip");
  hold.letGo();
  const auto& ended = sync.finish().ended;
  EXPECT_THAT(ended, UnorderedElementsAre("installed org.a", HasSubstr("failed org.b: ")));
  EXPECT_THAT(coordinators(), IsEmpty());
  EXPECT_THAT(apps(), ElementsAre("org.a 1.0"));
}

TEST_F(CoordinatedSync, ClearCancelsStaleCoordinators) {
  publish("org.a");
  for (int step = 20; coordinators().empty(); step += 10) {
    const Finished killed = sync({}, killedAt(step));
    ASSERT_EQ(killed.status, -SIGKILL) << "no kill left a coordinator";
  }
  ASSERT_EQ(runTool({"clear", device()}).status, 0);
  EXPECT_THAT(coordinators(), IsEmpty());
  EXPECT_THAT(apps(), AnyOf(IsEmpty(), ElementsAre("org.a 1.0")));
}

class Interrupted : public ToolFixtureOfEachMode {};
INSTANTIATE_TEST_SUITE_P(Modes, Interrupted, kModes, nameOfMode);

TEST_P(Interrupted, NextSyncInstallsTheRest) {
  for (const char* identifier : {"org.a", "org.b", "org.c"})
    publish(identifier);
  {
    StepHold hold("send package", 2);
    SyncInThisProcess sync(device(), library());
    hold.waitUntilHeld();
    std::raise(SIGINT);
    hold.letGo();
    const auto& ended = sync.finish().ended;
    EXPECT_EQ(ended.size(), 3U);
    EXPECT_THAT(ended, Contains("installed org.a"));
    EXPECT_THAT(ended, Contains(StartsWith("failed org.b: the sync was interrupted")));
    EXPECT_THAT(ended, Contains(StartsWith("failed org.c: the sync was interrupted")));
  }
  EXPECT_THAT(endsIn(sync({"--json"}).out),
              UnorderedElementsAre("skipped org.a", "installed org.b", "installed org.c"));
  EXPECT_THAT(apps(), UnorderedElementsAre("org.a 1.0", "org.b 1.0", "org.c 1.0"));
}

}  // namespace

}  // namespace appsync::test
