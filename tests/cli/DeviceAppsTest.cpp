// Commands on a device whose registry becomes unreadable while it is open.
#include <memory>
#include <string>
#include <utility>

#include <gtest/gtest.h>

#include "cli/ReportOptions.h"
#include "cli/StandardOutput.h"
#include "device/Device.h"
#include "host/BackupWriter.h"
#include "host/DeviceApps.h"
#include "host/Restore.h"
#include "kit/fakes/TemporaryFolder.h"

namespace appsync::test {
namespace {

class UnreadableRegistry : public testing::Test {
 protected:
  void SetUp() override {
    auto made = device::Device::create(path());
    ASSERT_TRUE(made.ok());
    device_ = std::move(made).value();
    device::Database::Session session(device_->services().database());
    ASSERT_TRUE(session.runScript("alter table bundles rename to lost").ok());
  }
  [[nodiscard]] std::string path() const { return folder_.path("device"); }
  [[nodiscard]] std::string reason() const {
    return path() + ": the device cannot be used (database: no such table: bundles); see to that and try again";
  }

  TemporaryFolder folder_;
  std::unique_ptr<device::Device> device_;
};

TEST_F(UnreadableRegistry, FailsList) {
  const auto apps = host::appsOn(*device_);
  ASSERT_FALSE(apps.ok());
  EXPECT_EQ(apps.error().text, reason());
}

TEST_F(UnreadableRegistry, FailsRestore) {
  cli::StandardOutput output;
  const auto reporter = cli::makeReporter({}, output, host::OperationKind::restore);
  host::SyncProgress progress(*reporter);
  const host::Backup backup{folder_.path("backup"), "a backup", {}, {}};
  const Status checked = host::Restore(*device_, backup, progress).check();
  ASSERT_FALSE(checked.ok());
  EXPECT_EQ(checked.error().text, reason());
}

TEST_F(UnreadableRegistry, FailsBackup) {
  const auto saved = host::writeBackup(*device_, folder_.path("backup"));
  ASSERT_FALSE(saved.ok());
  EXPECT_EQ(saved.error().text, folder_.path("backup") + " cannot be written and was not created: " + reason());
}

}  // namespace
}  // namespace appsync::test
