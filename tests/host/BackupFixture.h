// A device that is backed up, and a new one that it is restored to.
#pragma once

#include <algorithm>
#include <filesystem>
#include <map>
#include <string>
#include <vector>

#include "plist/PropertyList.h"
#include "tests/support/TestDevice.h"
#include "tests/support/ToolFixture.h"

namespace appsync::test {

/// The parameter is the install mode of both devices.
class BackupFixture : public ToolFixtureOfEachMode {
 protected:
  static constexpr const char* kData = "/root/var/mobile/Containers/Data/";

  static Finished run(const std::vector<std::string>& words, int status = 0) {
    Finished finished = runTool(words);
    EXPECT_EQ(finished.status, status) << words.front() << ": " << finished.err << finished.out;
    return finished;
  }

  /// Five apps: one plain, one with data and metadata, one with a licence, two demoted, one of them with data.
  void fillDevice() {
    publish("org.plain");
    publish("org.data", "2.0", {{"HarvoMetadata.plist", "{title = \"With Data\"; bundleVersion = \"2.0\";}"}});
    publish("org.licence");
    publish("org.wished");
    publish("org.auto", "3.0");
    ASSERT_EQ(sync().status, 0);
    writeData("org.data", "notes", "what was written");
    writeData("org.auto", "scores", "100");
    write(path("licence"), "a licence");
    run({"set", device(), "demote=org.wished", "demote-auto=org.auto", "licence=org.licence:" + path("licence")});
  }
  void writeData(const std::string& identifier, const std::string& name, std::string_view content) {
    std::filesystem::create_directories(device() + kData + identifier + "/Documents");
    write(device() + kData + identifier + "/Documents/" + name, content);
  }

  [[nodiscard]] std::string backup() const { return path("backup"); }
  [[nodiscard]] std::string newDevice() const { return path("new"); }
  void makeBackup() { run({"backup", device(), backup()}); }
  void makeNewDevice() const {
    std::filesystem::remove_all(newDevice());
    run({"init", newDevice(), GetParam()});
    run({"set", newDevice(), "store=" + library()});
  }
  [[nodiscard]] Finished restore(std::vector<std::string> more = {}, const ToolOptions& options = {}) const {
    more.insert(more.begin(), {"restore", newDevice(), backup()});
    return runTool(more, options);
  }
  [[nodiscard]] Finished syncNew(std::vector<std::string> more = {}, const ToolOptions& options = {}) const {
    return syncTo(newDevice(), std::move(more), options);
  }

  /// Returns everything that a restore must recreate: apps with version, install state and licence, the files of
  /// installed apps, and all data.
  [[nodiscard]] static std::vector<std::string> contentOf(const std::string& device) {
    std::vector<std::string> content;
    const auto opened = device::Device::open(device, device::Access::readOnly);
    EXPECT_TRUE(opened.ok());
    const auto apps = (*opened)->services().defaultRegistry().apps();
    for (const auto& app : *apps) {
      const auto licence = (*opened)->services().defaultRegistry().licenceData(app->applicationIdentifier());
      const bool isDemoted = !app->isInstalled() && device::isDemotion(app->installType());
      content.push_back(app->description() +
                        (isDemoted ? " demoted " + std::to_string(static_cast<int>(app->installType())) : "") +
                        (*licence ? " licence " + std::string(textOf(**licence)) : ""));
      if (app->isInstalled()) addFiles(device + "/root" + *app->bundlePath(), app->applicationIdentifier(), content);
    }
    addFiles(device + "/root/var/mobile/Containers/Data", "data", content);
    std::ranges::sort(content);
    return content;
  }

  static void addFiles(const std::string& folder, const std::string& prefix, std::vector<std::string>& content) {
    if (!std::filesystem::exists(folder)) return;
    for (const auto& entry : std::filesystem::recursive_directory_iterator(folder)) {
      if (!entry.is_regular_file()) continue;
      content.push_back(prefix + " " + std::filesystem::relative(entry.path(), folder).string() + ": " +
                        readHostFile(entry.path()));
    }
  }

  /// Returns "org.plain 1.0?" for each app of the new device, sorted.
  [[nodiscard]] std::vector<std::string> newApps() const {
    std::vector<std::string> all = appsOf(newDevice());
    std::ranges::sort(all);
    return all;
  }
};

}  // namespace appsync::test
