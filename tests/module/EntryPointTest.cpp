// The module's entry point, called by daemons of the same and of other versions.
#include <stdexcept>

#include <gtest/gtest.h>

#include "kit/fakes/FakePlatform.h"
#include "tests/module/LoadedModule.h"

namespace appsync::test {

namespace {

using platform::kModuleInterfaceVersion;
using Client = std::shared_ptr<platform::ZTClient>;

class EntryPoint : public testing::Test {
 protected:
  void ask(std::uint32_t version, platform::Platform* from) { makeClient_(version, from, &client, &answer); }

  FakePlatform platform;
  Client client;
  platform::ModuleAnswer answer = {99, "untouched"};

 private:
  const platform::ModuleEntryPoint makeClient_ = loadModule();
};

TEST_F(EntryPoint, CreatesAClientForItsVersion) {
  ask(kModuleInterfaceVersion, &platform);
  EXPECT_EQ(answer.interfaceVersion, kModuleInterfaceVersion);
  EXPECT_STREQ(answer.refusal, "");
  ASSERT_NE(client, nullptr);
  EXPECT_EQ(client->currentSyncAnchor(), "NO_APP_SYNC_ANCHOR");
}

TEST_F(EntryPoint, CreatesANewClientPerCall) {
  ask(kModuleInterfaceVersion, &platform);
  const Client first = std::exchange(client, nullptr);
  ask(kModuleInterfaceVersion, &platform);
  EXPECT_NE(client, nullptr);
  EXPECT_NE(client, first);
}

TEST_F(EntryPoint, RefusesAnotherVersionWithoutReadingArguments) {
  for (const std::uint32_t version : {0U, kModuleInterfaceVersion + 1}) {
    ask(version, nullptr);
    EXPECT_EQ(answer.interfaceVersion, kModuleInterfaceVersion);
    EXPECT_EQ(answer.refusal, "its interface version is " + std::to_string(kModuleInterfaceVersion) +
                                  " and the daemon's " + std::to_string(version));
    EXPECT_EQ(client, nullptr);
  }
}

/// A platform that throws in violation of its contract.
template <class Thrown>
class ThrowingBundles final : public platform::Bundles {
 public:
  explicit ThrowingBundles(Thrown thrown) : thrown_(std::move(thrown)) {}
  std::unique_ptr<platform::Bundle> openBundle(const platform::FileLocation&) override { return nullptr; }
  std::optional<std::string> mainBundleIdentifier() override { throw thrown_; }

 private:
  const Thrown thrown_;
};

TEST_F(EntryPoint, CatchesExceptions) {
  ThrowingBundles bundles(std::runtime_error("no bundles here"));
  platform.use(bundles);
  ask(kModuleInterfaceVersion, &platform);
  EXPECT_STREQ(answer.refusal, "no client can be made: no bundles here");
  EXPECT_EQ(answer.interfaceVersion, kModuleInterfaceVersion);
  EXPECT_EQ(client, nullptr);
}

TEST_F(EntryPoint, CatchesOtherThrownValues) {
  ThrowingBundles bundles(7);
  platform.use(bundles);
  ask(kModuleInterfaceVersion, &platform);
  EXPECT_STREQ(answer.refusal, "no client can be made: the platform threw something unknown");
  EXPECT_EQ(client, nullptr);
}

TEST_F(EntryPoint, TruncatesAndTerminatesALongReason) {
  ThrowingBundles bundles(std::runtime_error(std::string(1000, 'x')));
  platform.use(bundles);
  ask(kModuleInterfaceVersion, &platform);
  const std::string reason = "no client can be made: ";
  EXPECT_EQ(answer.refusal, reason + std::string(sizeof answer.refusal - 1 - reason.size(), 'x'));
}

}  // namespace

}  // namespace appsync::test
