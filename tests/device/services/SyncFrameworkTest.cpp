#include <cerrno>
#include <chrono>
#include <memory>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "base/Log.h"
#include "device/services/SyncFramework.h"
#include "platform/Keys.h"

namespace appsync::test {
namespace {

using device::LogSink;
using device::SyncFramework;
using device::TransferFailure;

struct Written {
  std::chrono::system_clock::time_point time;
  int category;
  LogLevel level;
  std::string message;
};

class MemorySink final : public LogSink {
 public:
  explicit MemorySink(std::vector<Written>& written) : written_(written) {}
  void write(std::chrono::system_clock::time_point time, int category, LogLevel level,
             std::string_view message) override {
    written_.push_back({time, category, level, std::string(message)});
  }

 private:
  std::vector<Written>& written_;
};

/// Fails the test if it is formatted.
struct Unprintable {};
void appendDescription(std::string&, const Unprintable&) {
  ADD_FAILURE() << "formatted for a disabled log";
}

TEST(SyncFrameworkLog, IsDisabledWithoutSink) {
  SyncFramework framework;
  LogCategory& category = framework.ZTGetLogCategory(8);
  EXPECT_FALSE(category.isEnabled(LogLevel::standard));
  EXPECT_FALSE(category.isEnabled(LogLevel::error));
  log(category, LogLevel::error, "%{public}@", Unprintable());
  category.write(LogLevel::error, "lost");
}

TEST(SyncFrameworkLog, SinkReceivesTimeCategoryLevelAndMessage) {
  std::vector<Written> written;
  SyncFramework framework;
  LogCategory& category = framework.ZTGetLogCategory(8);
  framework.logTo(std::make_unique<MemorySink>(written));
  EXPECT_TRUE(category.isEnabled(LogLevel::standard));
  EXPECT_TRUE(category.isEnabled(LogLevel::error));
  const auto before = std::chrono::system_clock::now();
  category.write(LogLevel::standard, "first");
  framework.ZTGetLogCategory(14).write(LogLevel::error, "second");
  ASSERT_EQ(written.size(), 2U);
  EXPECT_GE(written[0].time, before);
  EXPECT_LE(written[1].time, std::chrono::system_clock::now());
  EXPECT_EQ(written[0].category, 8);
  EXPECT_EQ(written[0].level, LogLevel::standard);
  EXPECT_EQ(written[0].message, "first");
  EXPECT_EQ(written[1].category, 14);
  EXPECT_EQ(written[1].level, LogLevel::error);
  EXPECT_EQ(written[1].message, "second");
}

TEST(SyncFrameworkLog, ReplacesSink) {
  std::vector<Written> first;
  std::vector<Written> second;
  SyncFramework framework;
  framework.logTo(std::make_unique<MemorySink>(first));
  framework.logTo(std::make_unique<MemorySink>(second));
  framework.ZTGetLogCategory(0).write(LogLevel::standard, "message");
  EXPECT_TRUE(first.empty());
  EXPECT_EQ(second.size(), 1U);
}

TEST(SyncFrameworkLog, ReturnsSameCategoryForNumber) {
  SyncFramework framework;
  EXPECT_EQ(&framework.ZTGetLogCategory(8), &framework.ZTGetLogCategory(8));
  EXPECT_NE(&framework.ZTGetLogCategory(8), &framework.ZTGetLogCategory(14));
}

TEST(SyncFrameworkLog, NumbersOutOfRangeShareACategory) {
  std::vector<Written> written;
  SyncFramework framework;
  framework.logTo(std::make_unique<MemorySink>(written));
  EXPECT_EQ(&framework.ZTGetLogCategory(32), &framework.ZTGetLogCategory(-5));
  framework.ZTGetLogCategory(1000).write(LogLevel::standard, "message");
  EXPECT_EQ(written.at(0).category, -1);
  framework.ZTGetLogCategory(31).write(LogLevel::standard, "message");
  EXPECT_EQ(written.at(1).category, 31);
}

Error errorOf(std::string_view domain, long code) {
  return {std::string(domain), code, "text", nullptr};
}

class RecoverableError : public testing::TestWithParam<Error> {};

TEST_P(RecoverableError, IsRecoverable) {
  EXPECT_TRUE(SyncFramework().ZTIsRecoverableError(GetParam()));
}

INSTANTIATE_TEST_SUITE_P(SyncFramework, RecoverableError,
                         testing::Values(errorOf("POSIX", EAGAIN), errorOf("POSIX", EINTR), errorOf("POSIX", EBUSY),
                                         errorOf("POSIX", ETIMEDOUT), errorOf("POSIX", ECANCELED),
                                         errorOf("POSIX", ENOSPC), errorOf("POSIX", EDQUOT), errorOf("POSIX", ENOMEM),
                                         errorOf("POSIX", EMFILE), errorOf("POSIX", ENFILE), errorOf("POSIX", EPIPE),
                                         errorOf("POSIX", ECONNRESET), errorOf("POSIX", ECONNABORTED),
                                         errorOf("POSIX", ECONNREFUSED), errorOf("POSIX", ENOTCONN),
                                         errorOf("POSIX", ENETDOWN), errorOf("POSIX", ENETUNREACH),
                                         errorOf("POSIX", EHOSTUNREACH),
                                         errorOf("ZTError", static_cast<long>(TransferFailure::interrupted)),
                                         errorOf("ZTError", static_cast<long>(TransferFailure::hostLost)),
                                         Error::fromErrno(ENOSPC, "writing").in("installing")),
                         [](const auto& test) { return "Number" + std::to_string(test.index); });

class UnrecoverableError : public testing::TestWithParam<Error> {};

TEST_P(UnrecoverableError, IsNotRecoverable) {
  EXPECT_FALSE(SyncFramework().ZTIsRecoverableError(GetParam()));
}

INSTANTIATE_TEST_SUITE_P(
    SyncFramework, UnrecoverableError,
    testing::Values(errorOf("POSIX", EINVAL), errorOf("POSIX", ENOENT), errorOf("POSIX", EIO), errorOf("POSIX", 0),
                    errorOf("ZTError", 1), errorOf("ZTError", 2), errorOf("ZTError", 29), errorOf("ZTError", 30),
                    errorOf("ZTError", EAGAIN), errorOf("", EAGAIN), errorOf(platform::kInstallerErrorDomain, EAGAIN),
                    Error{"Other", 1, "text", std::make_shared<const Error>(errorOf("POSIX", EAGAIN))}),
    [](const auto& test) { return "Number" + std::to_string(test.index); });

TEST(SyncFramework, CreatesDownloads) {
  const auto asset = SyncFramework().downloadAssetWithIdentifier("com.a", "Application", "Name");
  EXPECT_EQ(asset->identifier(), "com.a");
  EXPECT_EQ(asset->dataclass(), "Application");
  EXPECT_EQ(asset->prettyName(), "Name");
  EXPECT_TRUE(asset->isDownload());
  EXPECT_FALSE(asset->isRestore());
  EXPECT_EQ(SyncFramework().downloadAssetWithIdentifier("com.a", "Application", std::nullopt)->prettyName(),
            std::nullopt);
}

}  // namespace
}  // namespace appsync::test
