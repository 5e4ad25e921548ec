// Loading of the plug-in, and errors of plug-ins that cannot be used.
#include <filesystem>
#include <string>
#include <vector>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "generated/BuildPaths.h"
#include "platform/Module.h"
#include "tests/support/ToolFixture.h"

namespace appsync::test {

namespace {

namespace fs = std::filesystem;
using testing::HasSubstr;

constexpr const char* kWhatToDo = "; install the plug-in of this release there, or set APPSYNC_MODULE to its file";

std::string brokenModule(const std::string& name) {
  return std::string(kBinaryFolder) + "/broken_modules/" + name + ".so";
}

ToolOptions withModule(const std::string& path) {
  return {.environment = {{"APPSYNC_MODULE", path}}};
}

class PlugIn : public ToolFixture {
 protected:
  /// Returns the error of `appsync sync` for the module at `path`.
  void expectRefused(const std::string& path, const std::string& reason) const {
    const Finished run = sync({}, withModule(path));
    EXPECT_EQ(run.status, 3);
    EXPECT_EQ(run.out, "");
    EXPECT_EQ(run.err, "appsync: the plug-in " + path + " cannot be used: " + reason + "\n");
  }
};

TEST_F(PlugIn, RefusesMissingFile) {
  expectRefused(path("none.so"), std::string("cannot open shared object file: No such file or directory") + kWhatToDo);
}

TEST_F(PlugIn, RefusesEmptyFile) {
  write(path("empty.so"), "");
  expectRefused(path("empty.so"), std::string("file too short") + kWhatToDo);
}

TEST_F(PlugIn, RefusesFileThatIsNotAModule) {
  write(path("text.so"), std::string(8192, 'x'));
  expectRefused(path("text.so"), std::string("invalid ELF header") + kWhatToDo);
}

TEST_F(PlugIn, RefusesFolder) {
  expectRefused(library(), std::string("cannot read file data: Is a directory") + kWhatToDo);
}

TEST_F(PlugIn, RefusesModuleWithoutEntryPoint) {
  expectRefused(brokenModule("WithoutEntryPoint"), std::string("it has no entry point appsyncMakeClient") + kWhatToDo);
}

TEST_F(PlugIn, RefusesModuleOfAnotherVersion) {
  expectRefused(brokenModule("OfAnotherVersion"),
                "its interface version is " + std::to_string(platform::kModuleInterfaceVersion + 1) +
                    " and this program's " + std::to_string(platform::kModuleInterfaceVersion) + kWhatToDo);
}

TEST_F(PlugIn, RefusesModuleWithoutClient) {
  expectRefused(brokenModule("WithoutReason"), "it refused to create a client without a reason");
}

TEST_F(PlugIn, DoesNotReadBeyondTheReason) {
  expectRefused(brokenModule("WithoutEnd"), std::string(252, 'x'));
}

TEST_F(PlugIn, ResolvesRelativePath) {
  const Finished run = sync({}, withModule("none.so"));
  EXPECT_EQ(run.status, 3);
  EXPECT_THAT(run.err, HasSubstr((fs::current_path() / "none.so").string() + " "));
}

TEST_F(PlugIn, IgnoresEmptyVariable) {
  publish("org.a");
  EXPECT_EQ(sync({}, withModule("")).status, 0);
}

TEST_F(PlugIn, IsFoundRelativeToTheTool) {
  const fs::path tool = path("prefix/bin/appsync");
  const fs::path folder = (tool.parent_path() / fs::relative(kModule, kBinaryFolder)).lexically_normal().parent_path();
  fs::create_directories(tool.parent_path());
  fs::create_directories(folder);
  fs::copy_file(std::string(kBinaryFolder) + "/appsync", tool);
  fs::create_symlink(tool, path("appsync"));
  const auto syncThroughLink = [&] { return ToolRun({"sync", device(), library()}, {}, path("appsync")).wait(); };

  EXPECT_THAT(syncThroughLink().err, HasSubstr((folder / "AppsClient.so").string() + " cannot be used: "));
  fs::copy_file(kModule, folder / "AppsClient.so");
  EXPECT_EQ(syncThroughLink().status, 0);
}

TEST_F(PlugIn, IsNotLoadedIfUnused) {
  for (const char* command : {"apps", "history"})
    EXPECT_EQ(runTool({command, device()}, withModule(path("none.so"))).status, 0) << command;
}

TEST_F(PlugIn, MissingPlugInFailsReport) {
  const Finished run = runTool({"report", device()}, withModule(path("none.so")));
  EXPECT_EQ(run.status, 3);
  EXPECT_EQ(run.out, "");
  EXPECT_THAT(run.err, HasSubstr(kWhatToDo));
}

TEST_F(PlugIn, MissingPlugInFailsBackup) {
  const Finished run = runTool({"backup", device(), path("backup")}, withModule(path("none.so")));
  EXPECT_EQ(run.status, 3);
  EXPECT_THAT(run.err, HasSubstr(kWhatToDo));
  EXPECT_FALSE(fs::exists(path("backup")));
}

TEST_F(PlugIn, MissingPlugInFailsRestore) {
  ASSERT_EQ(runTool({"backup", device(), path("backup")}).status, 0);
  ASSERT_EQ(runTool({"init", path("new")}).status, 0);
  const Finished run = runTool({"restore", path("new"), path("backup"), "--json"}, withModule(path("none.so")));
  EXPECT_EQ(run.status, 3);
  EXPECT_EQ(run.out, "");
  EXPECT_THAT(run.err, HasSubstr(kWhatToDo));
  EXPECT_FALSE(fs::exists(path("new") + "/root/var/mobile/Media/HarvoRestore"));
}

TEST_F(PlugIn, MissingPlugInFailsClear) {
  publish("org.a");
  ASSERT_EQ(sync().status, 0);
  const std::string before = runTool({"history", device()}).out;
  const Finished run = runTool({"clear", device()}, withModule(path("none.so")));
  EXPECT_EQ(run.status, 3);
  EXPECT_THAT(run.err, HasSubstr(kWhatToDo));
  EXPECT_EQ(runTool({"history", device()}).out, before);
}

}  // namespace

}  // namespace appsync::test
