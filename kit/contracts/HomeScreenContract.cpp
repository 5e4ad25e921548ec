#include "kit/contracts/HomeScreenContract.h"

#include <memory>
#include <string>
#include <thread>
#include <vector>

#include "kit/fakes/Threads.h"
#include "plist/PropertyList.h"

namespace appsync::test {

using platform::TerminationAssertion;
using platform::TerminationAssertionOutcome;

GTEST_ALLOW_UNINSTANTIATED_PARAMETERIZED_TEST(HomeScreenContract);

namespace {

constexpr TerminationAssertionOutcome kNotSet{77};

std::vector<std::string> orderOf(platform::HomeScreenService& screen) {
  const std::optional<Bytes> bytes = screen.getFlattenedIconState(screen.blockableServerPort(), 1);
  if (!bytes) return {"(no answer)"};
  const Result<plist::Value> order = plist::read(*bytes);
  if (!order || order->array() == nullptr) return {"(no array)"};
  std::vector<std::string> identifiers;
  for (const plist::Value& identifier : *order->array())
    identifiers.emplace_back(identifier.string().value_or("(no string)"));
  return identifiers;
}

void handOver(platform::HomeScreenService& screen, std::string_view layout) {
  // The buffer is destroyed after the call.
  const std::string buffer(layout);
  screen.setIconState(screen.blockableServerPort(), bytesOf(buffer));
}

}  // namespace

TEST_P(HomeScreenContract, PortDoesNotChange) {
  EXPECT_EQ(subject().homeScreen().blockableServerPort(), subject().homeScreen().blockableServerPort());
}

TEST_P(HomeScreenContract, OrderIsAnArrayOfIdentifiers) {
  subject().addApp("com.b");
  subject().addApp("com.a");
  EXPECT_EQ(orderOf(subject().homeScreen()), (std::vector<std::string>{"com.b", "com.a"}));
}

TEST_P(HomeScreenContract, CallerOwnsTheOrder) {
  subject().addApp("com.a");
  platform::HomeScreenService& screen = subject().homeScreen();
  std::optional<Bytes> bytes = screen.getFlattenedIconState(screen.blockableServerPort(), 1);
  ASSERT_TRUE(bytes);
  bytes->assign(bytes->size(), std::byte{0});
  EXPECT_EQ(orderOf(screen), std::vector<std::string>{"com.a"});
}

TEST_P(HomeScreenContract, AppliesAHostsLayout) {
  const std::vector<std::string> wanted{"com.b", "com.c", "com.a"};
  const std::optional<std::string> layout = subject().layoutOf(wanted);
  if (!layout) GTEST_SKIP() << "the subject has no layouts";
  for (const char* identifier : {"com.a", "com.b", "com.c"})
    subject().addApp(identifier);
  handOver(subject().homeScreen(), *layout);
  EXPECT_EQ(orderOf(subject().homeScreen()), wanted);
}

TEST_P(HomeScreenContract, IgnoresAnInvalidLayout) {
  subject().addApp("com.b");
  subject().addApp("com.a");
  const std::vector<std::string> order = orderOf(subject().homeScreen());
  for (const char* layout : {"", "garbage", "bplist00", "<plist><array>", "<plist><integer>7</integer></plist>"}) {
    handOver(subject().homeScreen(), layout);
    EXPECT_EQ(orderOf(subject().homeScreen()), order) << layout;
  }
}

TEST_P(HomeScreenContract, GrantsAnAssertion) {
  subject().addApp("com.a");
  TerminationAssertionOutcome outcome = kNotSet;
  const auto assertion = subject().homeScreen().terminationAssertionCreate("com.a", 0, outcome);
  EXPECT_EQ(outcome, TerminationAssertionOutcome::granted);
  EXPECT_NE(assertion, nullptr);
}

TEST_P(HomeScreenContract, UnknownAppIsNotFound) {
  TerminationAssertionOutcome outcome = kNotSet;
  const auto assertion = subject().homeScreen().terminationAssertionCreate("com.unknown", 0, outcome);
  EXPECT_EQ(outcome, TerminationAssertionOutcome::notFound);
}

TEST_P(HomeScreenContract, DeniedRequestReturnsNull) {
  subject().addApp("com.a");
  if (!subject().denyAssertions("com.a")) GTEST_SKIP() << "the subject cannot deny assertions";
  TerminationAssertionOutcome outcome = kNotSet;
  const auto assertion = subject().homeScreen().terminationAssertionCreate("com.a", 0, outcome);
  EXPECT_EQ(outcome, TerminationAssertionOutcome::denied);
  EXPECT_EQ(assertion, nullptr);
}

TEST_P(HomeScreenContract, AlwaysSetsTheOutcome) {
  for (const char* identifier : {"", "com.a", "not an identifier /.."}) {
    TerminationAssertionOutcome outcome = kNotSet;
    static_cast<void>(subject().homeScreen().terminationAssertionCreate(identifier, 0, outcome));
    EXPECT_NE(outcome, kNotSet) << identifier;
  }
}

TEST_P(HomeScreenContract, AssertionCanEndOnAnotherThread) {
  subject().addApp("com.a");
  TerminationAssertionOutcome outcome = kNotSet;
  std::unique_ptr<TerminationAssertion> assertion =
      subject().homeScreen().terminationAssertionCreate("com.a", 0, outcome);
  std::jthread([&] { assertion.reset(); }).join();
  assertion = subject().homeScreen().terminationAssertionCreate("com.a", 0, outcome);
  EXPECT_EQ(outcome, TerminationAssertionOutcome::granted);
}

TEST_P(HomeScreenContract, IsThreadSafe) {
  subject().addApp("com.a");
  runOnThreads(10, [&](std::size_t) {
    TerminationAssertionOutcome outcome = kNotSet;
    const auto assertion = subject().homeScreen().terminationAssertionCreate("com.a", 0, outcome);
    EXPECT_EQ(outcome, TerminationAssertionOutcome::granted);
    EXPECT_EQ(orderOf(subject().homeScreen()), std::vector<std::string>{"com.a"});
  });
}

}  // namespace appsync::test
