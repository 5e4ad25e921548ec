// A device, a library, and the tool.
#pragma once

#include <filesystem>
#include <fstream>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "cli/Json.h"
#include "kit/fakes/TemporaryFolder.h"
#include "tests/support/ToolRun.h"
#include "tests/support/ZipArchive.h"

namespace appsync::test {

class ToolFixture : public testing::Test {
 protected:
  /// `mode` is the install mode of the device, an option of `appsync init`; empty for the default.
  explicit ToolFixture(std::string mode = {}) : mode_(std::move(mode)) {}

  void SetUp() override {
    std::filesystem::create_directory(library());
    makeDevice();
  }
  void makeDevice() const {
    std::vector<std::string> words = {"init", device()};
    if (!mode_.empty()) words.push_back(mode_);
    ASSERT_EQ(runTool(words).status, 0);
  }

  [[nodiscard]] std::string device() const { return folder_.path("device"); }
  [[nodiscard]] std::string library() const { return folder_.path("library"); }
  [[nodiscard]] std::string path(const std::string& name) const { return folder_.path(name); }

  void write(const std::string& path, std::string_view content) const {
    std::ofstream(path, std::ios::binary) << content;
  }
  /// Adds a valid package to the library.
  void publish(const std::string& identifier, const std::string& version = "1.0",
               const std::vector<ZipEntry>& more = {}) const {
    write(library() + "/" + identifier + "-" + version + ".zip", appPackage(identifier, version, more));
  }
  [[nodiscard]] Finished sync(std::vector<std::string> more = {}, const ToolOptions& options = {}) const {
    return syncTo(device(), std::move(more), options);
  }
  [[nodiscard]] Finished syncTo(const std::string& device, std::vector<std::string> more = {},
                                const ToolOptions& options = {}) const {
    more.insert(more.begin(), {"sync", device, library()});
    return runTool(more, options);
  }

  /// Parses the output of a sync with `--json`.
  [[nodiscard]] static std::vector<cli::Json> eventsIn(const std::string& output) {
    std::vector<cli::Json> events;
    for (std::size_t start = 0; start < output.size();) {
      const std::size_t end = output.find('\n', start);
      events.push_back(cli::Json::parse(output.substr(start, end - start)));
      start = end == std::string::npos ? output.size() : end + 1;
    }
    return events;
  }
  /// Returns "installed org.a" for each outcome in the output of a sync with `--json`.
  [[nodiscard]] static std::vector<std::string> endsIn(const std::string& output) {
    std::vector<std::string> ends;
    for (const cli::Json& event : eventsIn(output)) {
      const std::string kind = event.at("event");
      if (kind == "progress" || kind == "summary" || kind == "waiting") continue;
      ends.push_back(kind + " " + std::string(event.at("identifier")));
    }
    return ends;
  }
  /// Returns each app on the device as "identifier version", followed by "?" for placeholders.
  [[nodiscard]] std::vector<std::string> apps() const { return appsOf(device()); }
  [[nodiscard]] static std::vector<std::string> appsOf(const std::string& device) {
    const Finished listed = runTool({"apps", device, "--json"});
    EXPECT_EQ(listed.status, 0) << listed.err;
    std::vector<std::string> all;
    for (const cli::Json& app : cli::Json::parse(listed.out)) {
      const std::string version = app.at("version").is_null() ? "" : std::string(app.at("version"));
      all.push_back(std::string(app.at("identifier")) + " " + version + (app.at("placeholder") ? "?" : ""));
    }
    return all;
  }

 private:
  const std::string mode_;
  TemporaryFolder folder_;
};

/// A ToolFixture for each install mode. Instantiate with `kModes` and `nameOfMode`.
class ToolFixtureOfEachMode : public ToolFixture, public testing::WithParamInterface<const char*> {
 protected:
  ToolFixtureOfEachMode() : ToolFixture(GetParam()) {}
};

inline const auto kModes = testing::Values("--coordinated", "--direct");
[[nodiscard]] inline std::string nameOfMode(const testing::TestParamInfo<const char*>& mode) {
  return std::string(mode.param).substr(2);
}

}  // namespace appsync::test
