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

TEST_P(UninstalledAppsListContract, ReinstalledAppIsRemoved) {
  subject().removeRealApp("com.a");
  subject().removeRealApp("com.b");
  subject().installApp("com.a");
  EXPECT_EQ(identifiersIn(subject().list()), Identifiers{"com.b"});
}

TEST_P(UninstalledAppsListContract, ClearingRemovesTheGivenApps) {
  for (const char* identifier : {"com.a", "com.b", "com.c"})
    subject().removeRealApp(identifier);
  EXPECT_EQ(subject().list().clearUninstalled({"com.a", "com.c"}), 0);
  EXPECT_EQ(identifiersIn(subject().list()), Identifiers{"com.b"});
}

TEST_P(UninstalledAppsListContract, ClearingIgnoresUnknownApps) {
  subject().removeRealApp("com.a");
  EXPECT_EQ(subject().list().clearUninstalled({"com.unknown", "com.a", "com.a", ""}), 0);
  EXPECT_EQ(identifiersIn(subject().list()), Identifiers());
}

TEST_P(UninstalledAppsListContract, ClearingNothingSucceeds) {
  subject().removeRealApp("com.a");
  EXPECT_EQ(subject().list().clearUninstalled({}), 0);
  EXPECT_EQ(identifiersIn(subject().list()), Identifiers{"com.a"});
}

TEST_P(UninstalledAppsListContract, FailedClearingChangesNothing) {
  subject().removeRealApp("com.a");
  subject().removeRealApp("com.b");
  if (!subject().failClearing()) GTEST_SKIP() << "the subject cannot fail clearing";
  EXPECT_NE(subject().list().clearUninstalled({"com.a", "com.b"}), 0);
  EXPECT_EQ(identifiersIn(subject().list()), (Identifiers{"com.a", "com.b"}));
}

TEST_P(UninstalledAppsListContract, CallerOwnsTheResult) {
  subject().removeRealApp("com.a");
  std::optional<plist::Dictionary> answer = subject().list().lookupUninstalled();
  ASSERT_TRUE(answer);
  answer->erase("com.a");
  EXPECT_EQ(identifiersIn(subject().list()), Identifiers{"com.a"});
}

TEST_P(UninstalledAppsListContract, SurvivesARestart) {
  subject().removeRealApp("com.a");
  subject().removeRealApp("com.b");
  ASSERT_EQ(subject().list().clearUninstalled({"com.b"}), 0);
  if (!subject().restart()) GTEST_SKIP() << "the subject cannot restart";
  EXPECT_EQ(identifiersIn(subject().list()), Identifiers{"com.a"});
}

TEST_P(UninstalledAppsListContract, IsThreadSafe) {
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
