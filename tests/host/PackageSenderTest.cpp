#include <cerrno>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <memory>
#include <string>
#include <vector>

#include <gtest/gtest.h>
#include <unistd.h>

#include "device/Device.h"
#include "host/PackageSender.h"
#include "kit/fakes/TemporaryFolder.h"

namespace appsync::host {
namespace {

namespace fs = std::filesystem;

const std::string kContent(300'000, 'p');

/// A package where `folder` is, and a device to send it to.
class PackageSending : public testing::Test {
 protected:
  void SetUp() override {
    auto made = device::Device::create(folder_.path("device"));
    ASSERT_TRUE(made.ok());
    device_ = std::move(made).value();
  }

  Result<std::string> send(const std::string& package, const PackageSender::GoOn& goOn) {
    std::ofstream(package, std::ios::binary) << kContent;
    PackageSender sender(device_->services().fileSystem());
    return sender.send({package, {"org.a", "A", "1.0"}, kContent.size()}, goOn);
  }

  [[nodiscard]] fs::path staged(const std::string& name) const {
    return fs::path(folder_.path("device/root/var/mobile/Media/PublicStaging")) / name;
  }
  [[nodiscard]] static std::string contentOf(const fs::path& path) {
    std::ifstream file(path, std::ios::binary);
    return {std::istreambuf_iterator<char>(file), {}};
  }
  /// Returns all files in the staging folder.
  [[nodiscard]] std::size_t stagedFiles() const {
    std::size_t count = 0;
    for (const auto& entry : fs::recursive_directory_iterator(staged("")))
      count += entry.is_regular_file() ? 1U : 0U;
    return count;
  }

  const test::TemporaryFolder folder_;
  std::unique_ptr<device::Device> device_;
};

bool always(double) {
  return true;
}

TEST_F(PackageSending, LinksOnTheSameFileSystem) {
  const std::string package = folder_.path("a.zip");
  std::vector<double> fractions;
  const auto sent = send(package, [&](double fraction) {
    fractions.push_back(fraction);
    return true;
  });
  ASSERT_TRUE(sent.ok()) << sent.error().text;
  EXPECT_TRUE(fs::equivalent(package, staged(*sent)));
  EXPECT_EQ(fractions, (std::vector<double>{0, 1}));
}

TEST_F(PackageSending, RemovingTheLinkKeepsThePackage) {
  const std::string package = folder_.path("a.zip");
  const auto sent = send(package, always);
  ASSERT_TRUE(sent.ok());
  ASSERT_TRUE(device_->services().fileSystem().removeItem("/var/mobile/Media/PublicStaging/" + *sent).ok());
  EXPECT_EQ(contentOf(package), kContent);
  EXPECT_EQ(fs::hard_link_count(package), 1U);
}

TEST_F(PackageSending, CopiesFromAnotherFileSystem) {
  const std::string package = "/dev/shm/appsync-sender-" + std::to_string(::getpid()) + ".zip";
  std::vector<double> fractions;
  const auto sent = send(package, [&](double fraction) {
    fractions.push_back(fraction);
    return true;
  });
  fs::remove(package);
  ASSERT_TRUE(sent.ok()) << sent.error().text;
  EXPECT_EQ(contentOf(staged(*sent)), kContent);
  EXPECT_EQ(fractions.back(), 1);
}

TEST_F(PackageSending, CancelledTransferLeavesNothing) {
  const std::string package = folder_.path("a.zip");
  for (const double last : {0.0, 1.0}) {
    const auto sent = send(package, [&](double fraction) { return fraction < last; });
    ASSERT_FALSE(sent.ok());
    EXPECT_EQ(sent.error().code, ECANCELED);
    EXPECT_EQ(stagedFiles(), 0U);
    EXPECT_EQ(contentOf(package), kContent);
  }
}

}  // namespace
}  // namespace appsync::host
