#include "kit/contracts/UninstalledAppsListContract.h"

#include <optional>
#include <string>
#include <vector>

#include "kit/fakes/Threads.h"

namespace appsync::test {

GTEST_ALLOW_UNINSTANTIATED_PARAMETERIZED_TEST(UninstalledAppsListContract);

namespace {

using Identifiers = std::vector<std::string>;

Identifiers identifiersIn(platform::UninstalledAppsList& list) {
  const std::optional<plist::Dictionary> answer = list.lookupUninstalled();
  if (!answer) return {"(no answer)"};
  Identifiers identifiers;
  for (const auto& [identifier, value] : *answer)
    identifiers.emplace_back(identifier);
  return identifiers;
}

}  // namespace

TEST_P(UninstalledAppsListContract, IsEmptyWhenNothingWasRemoved) {
  EXPECT_EQ(identifiersIn(subject().list()), Identifiers());
}

TEST_P(UninstalledAppsListContract, ListsRemovedApps) {
  subject().removeRealApp("com.b");
  subject().removeRealApp("com.a");
  EXPECT_EQ(identifiersIn(subject().list()), (Identifiers{"com.a", "com.b"}));
}

TEST_P(UninstalledAppsListContract, AnAppThatIsInstalledAgainIsTakenOff) {
  subject().removeRealApp("com.a");
  subject().removeRealApp("com.b");
  subject().installApp("com.a");
  EXPECT_EQ(identifiersIn(subject().list()), Identifiers{"com.b"});
}

TEST_P(UninstalledAppsListContract, ClearingTakesOffTheNamedApps) {
  for (const char* identifier : {"com.a", "com.b", "com.c"})
    subject().removeRealApp(identifier);
  EXPECT_EQ(subject().list().clearUninstalled({"com.a", "com.c"}), 0);
  EXPECT_EQ(identifiersIn(subject().list()), Identifiers{"com.b"});
}

TEST_P(UninstalledAppsListContract, UnknownAppsDoNotMatterWhenClearing) {
  subject().removeRealApp("com.a");
  EXPECT_EQ(subject().list().clearUninstalled({"com.unknown", "com.a", "com.a", ""}), 0);
  EXPECT_EQ(identifiersIn(subject().list()), Identifiers());
}

TEST_P(UninstalledAppsListContract, ClearingNothingIsASuccess) {
  subject().removeRealApp("com.a");
  EXPECT_EQ(subject().list().clearUninstalled({}), 0);
  EXPECT_EQ(identifiersIn(subject().list()), Identifiers{"com.a"});
}

TEST_P(UninstalledAppsListContract, ClearingThatFailsTakesOffNone) {
  subject().removeRealApp("com.a");
  subject().removeRealApp("com.b");
  if (!subject().failClearing()) GTEST_SKIP() << "cannot be made to fail";
  EXPECT_NE(subject().list().clearUninstalled({"com.a", "com.b"}), 0);
  EXPECT_EQ(identifiersIn(subject().list()), (Identifiers{"com.a", "com.b"}));
}

TEST_P(UninstalledAppsListContract, TheAnswerIsTheCallersOwn) {
  subject().removeRealApp("com.a");
  std::optional<plist::Dictionary> answer = subject().list().lookupUninstalled();
  ASSERT_TRUE(answer);
  answer->erase("com.a");
  EXPECT_EQ(identifiersIn(subject().list()), Identifiers{"com.a"});
}

TEST_P(UninstalledAppsListContract, OutlivesTheProcess) {
  subject().removeRealApp("com.a");
  subject().removeRealApp("com.b");
  ASSERT_EQ(subject().list().clearUninstalled({"com.b"}), 0);
  if (!subject().restart()) GTEST_SKIP() << "cannot be started again";
  EXPECT_EQ(identifiersIn(subject().list()), Identifiers{"com.a"});
}

TEST_P(UninstalledAppsListContract, ManyThreadsMayAskAndClearAtOnce) {
  constexpr std::size_t kThreads = 8;
  for (std::size_t index = 0; index < kThreads; ++index)
    subject().removeRealApp("com.a" + std::to_string(index));
  runOnThreads(kThreads, [&](std::size_t index) {
    EXPECT_TRUE(subject().list().lookupUninstalled());
    EXPECT_EQ(subject().list().clearUninstalled({"com.a" + std::to_string(index)}), 0);
  });
  EXPECT_EQ(identifiersIn(subject().list()), Identifiers());
}

}  // namespace appsync::test
