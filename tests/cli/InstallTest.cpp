// The result of `cmake --install`, without access to the repository.
#include <filesystem>
#include <fstream>
#include <iterator>
#include <regex>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "generated/BuildPaths.h"
#include "tests/support/ToolFixture.h"

namespace appsync::test {

namespace {

namespace fs = std::filesystem;
using Strings = std::vector<std::string>;

Finished run(const std::string& program, const Strings& words, const ToolOptions& options = {}) {
  return ToolRun(words, options, program).wait();
}

std::string contentOf(const fs::path& path) {
  std::ifstream file(path);
  return {std::istreambuf_iterator<char>(file), {}};
}

/// A prefix that was moved after the installation.
class Install : public ToolFixture {
 protected:
  static void SetUpTestSuite() {
    folder_ = std::make_unique<TemporaryFolder>();
    const std::string build = fs::path(kBinaryFolder).parent_path().string();
    const Finished installed = run("cmake", {"--install", build, "--prefix", folder_->path("first")});
    ASSERT_EQ(installed.status, 0) << installed.err;
    fs::rename(folder_->path("first"), prefix());
  }
  static void TearDownTestSuite() { folder_.reset(); }

  static std::string prefix() { return folder_->path("moved"); }
  static std::string headers() { return prefix() + "/include/appsync"; }

 private:
  inline static std::unique_ptr<TemporaryFolder> folder_;
};

Strings quotedIncludesOf(const fs::path& header) {
  static const std::regex kInclude("#include \"([^\"]+)\"");
  const std::string text = contentOf(header);
  return {std::sregex_token_iterator(text.begin(), text.end(), kInclude, 1), std::sregex_token_iterator()};
}

TEST_F(Install, EveryHeaderCompiles) {
  std::size_t found = 0;
  for (const fs::directory_entry& entry : fs::recursive_directory_iterator(headers())) {
    if (!entry.is_regular_file()) continue;
    EXPECT_EQ(entry.path().extension(), ".h");
    for (const std::string& included : quotedIncludesOf(entry.path())) {
      EXPECT_TRUE(fs::exists(fs::path(headers()) / included)) << entry.path() << " includes " << included;
      ++found;
    }
  }
  EXPECT_GT(found, 100);
}

TEST_F(Install, PublicHeadersNeedOneIncludeRoot) {
  write(path("user.cpp"),
        "#include \"core/AppsClient.h\"\n#include \"platform/SyncFiles.h\"\n#include \"platform/Module.h\"\n");
  const Finished compiled = run(kCompiler, {"-std=c++20", "-fsyntax-only", "-I" + headers(), path("user.cpp")});
  EXPECT_EQ(compiled.status, 0) << compiled.err;
}

TEST_F(Install, TheToolFindsItsModule) {
  publish("org.a");
  const Finished synced = run(prefix() + "/bin/appsync", {"sync", device(), library()});
  EXPECT_EQ(synced.status, 0) << synced.err;
  EXPECT_EQ(apps(), Strings{"org.a 1.0"});
}

TEST_F(Install, PkgConfigFindsLibrariesAndModule) {
  std::string folder;
  for (const fs::directory_entry& entry : fs::recursive_directory_iterator(prefix())) {
    if (entry.path().filename() == "appsync.pc") folder = entry.path().parent_path().string();
  }
  const ToolOptions there = {.environment = {{"PKG_CONFIG_PATH", folder}}};
  const Finished module = run("pkg-config", {"--variable=module", "appsync"}, there);
  EXPECT_TRUE(fs::exists(module.out.substr(0, module.out.find('\n')))) << module.out << module.err;

  write(path("user.cpp"),
        "#include \"core/AppsClient.h\"\nint main() { return &appsync::AppsClient::create == nullptr; }\n");
  const std::string flags = run("pkg-config", {"--cflags", "--libs", "appsync"}, there).out;
  const std::string compiler = std::string(kCompiler) + " " + kInstrumentation;
  const std::string command = compiler + " -std=c++20 -o '" + path("user") + "' '" + path("user.cpp") + "' " + flags;
  const Finished linked = run("sh", {"-c", command});
  EXPECT_EQ(linked.status, 0) << linked.err;
}

TEST_F(Install, InstallsManPagesAndCompletions) {
  for (const char* file : {"man/man1/appsync.1", "man/man1/appsync-sync.1", "bash-completion/completions/appsync",
                           "zsh/site-functions/_appsync", "fish/vendor_completions.d/appsync.fish"})
    EXPECT_TRUE(fs::exists(prefix() + "/share/" + file)) << file;
}

}  // namespace

}  // namespace appsync::test
