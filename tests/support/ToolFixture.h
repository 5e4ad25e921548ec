// A device, a library and the tool between them.
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
  /// The device is made with this option, if there is one.
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
  /// Puts a good package into the library.
  void publish(const std::string& identifier, const std::string& version = "1.0",
               const std::vector<ZipEntry>& more = {}) const {
    write(library() + "/" + identifier + "-" + version + ".zip", appPackage(identifier, version, more));
  }
  [[nodiscard]] Finished sync(std::vector<std::string> more = {}, const ToolOptions& options = {}) const {
    more.insert(more.begin(), {"sync", device(), library()});
    return runTool(more, options);
  }

  /// Every line of a `--json` sync.
  [[nodiscard]] static std::vector<cli::Json> eventsIn(const std::string& output) {
    std::vector<cli::Json> events;
    for (std::size_t start = 0; start < output.size();) {
      const std::size_t end = output.find('\n', start);
      events.push_back(cli::Json::parse(output.substr(start, end - start)));
      start = end == std::string::npos ? output.size() : end + 1;
    }
    return events;
  }
  /// "installed org.a, failed b.zip: reason" for the terminal events.
  [[nodiscard]] static std::vector<std::string> endsIn(const std::string& output) {
    std::vector<std::string> ends;
    for (const cli::Json& event : eventsIn(output)) {
      const std::string kind = event.at("event");
      if (kind == "progress" || kind == "summary" || kind == "waiting") continue;
      ends.push_back(kind + " " + std::string(event.at("identifier")));
    }
    return ends;
  }
  /// Each app on the device as "identifier version", placeholders with a question mark behind.
  [[nodiscard]] std::vector<std::string> apps() const {
    const Finished listed = runTool({"apps", device(), "--json"});
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

/// The same on a device of each mode.
class ToolFixtureOfEachMode : public ToolFixture, public testing::WithParamInterface<const char*> {
 protected:
  ToolFixtureOfEachMode() : ToolFixture(GetParam()) {}
};

/// To be instantiated with these.
inline const auto kModes = testing::Values("--coordinated", "--direct");
[[nodiscard]] inline std::string nameOfMode(const testing::TestParamInfo<const char*>& mode) {
  return std::string(mode.param).substr(2);
}

}  // namespace appsync::test
