// Crashes while data is kept, restored, or removed with its app.
#include <gtest/gtest.h>

#include "device/apps/BackupManager.h"
#include "tests/support/KilledDevice.h"

namespace appsync::test {
namespace {

class AppDataKill : public testing::Test {
 protected:
  void SetUp() override {
    std::filesystem::create_directories(source() + "/Documents");
    writeHostFile(source() + "/Documents/notes", "what was written");
  }
  [[nodiscard]] std::string source() const { return folder_.path("data"); }
  [[nodiscard]] static device::BackupManager manager(TestDevice& device) {
    return {device.services().database(), device.files()};
  }
  [[nodiscard]] static std::string notesIn(const TestDevice& device, std::string_view folder) {
    const std::string path = device.host(folder) + "/com.a/Documents/notes";
    return std::filesystem::exists(path) ? readHostFile(path) : "none";
  }
  /// Returns "kept", "the app's" or "gone", after checking that the data is complete and in one place only.
  [[nodiscard]] static std::string whereNotesAre(TestDevice& device) {
    const bool isKept = manager(device).restoreDataExists("com.a", nullptr);
    const std::string kept = notesIn(device, device::kRestoreDataPath);
    const std::string own = notesIn(device, device::kDataPath);
    if (kept == "what was written" && own == "none" && isKept) return "kept";
    if (own == "what was written" && kept == "none") return "the app's";
    return kept == "none" && own == "none" && !isKept ? "gone" : "kept: " + kept + ", own: " + own;
  }

 private:
  TemporaryFolder folder_;
};

TEST_F(AppDataKill, KeepIsAtomic) {
  killAtEveryStep([](TestDevice&) {},
                  [&](TestDevice& device) { EXPECT_TRUE(manager(device).keepRestoreData("com.a", source())); },
                  [](TestDevice& device) {
                    const std::string where = whereNotesAre(device);
                    EXPECT_TRUE(where == "kept" || where == "gone") << where;
                  });
}

TEST_F(AppDataKill, InstallMovesKeptDataAtomically) {
  killAtEveryStep([&](TestDevice& device) { EXPECT_TRUE(manager(device).keepRestoreData("com.a", source())); },
                  [](TestDevice& device) { device.install("com.a"); },
                  [](TestDevice& device) {
                    const std::string where = whereNotesAre(device);
                    const bool isIn = versionOf(device, "com.a") == "1.0";
                    EXPECT_TRUE(where == "the app's" || (where == "kept" && !isIn)) << where;
                    // The next process finds all of the data.
                    device.install("com.a");
                    EXPECT_EQ(whereNotesAre(device), "the app's");
                    EXPECT_FALSE(manager(device).restoreDataExists("com.a", nullptr));
                  });
}

TEST_F(AppDataKill, RemovalDeletesData) {
  killAtEveryStep(
      [&](TestDevice& device) {
        EXPECT_TRUE(manager(device).keepRestoreData("com.a", source()));
        device.install("com.a");
      },
      [](TestDevice& device) { EXPECT_TRUE(device.registry().uninstallApplication("com.a")); },
      [](TestDevice& device) {
        EXPECT_EQ(whereNotesAre(device), versionOf(device, "com.a") == "none" ? "gone" : "the app's");
      });
}

}  // namespace
}  // namespace appsync::test
