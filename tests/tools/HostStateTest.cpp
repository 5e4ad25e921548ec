#include <filesystem>
#include <fstream>

#include <gtest/gtest.h>

#include "kit/fakes/TemporaryFolder.h"
#include "tools/HostState.h"

namespace appsync::tools {
namespace {

TEST(HostState, IsEmptyWhereNoneIsKept) {
  const test::TemporaryFolder folder;
  EXPECT_EQ(loadHostState(folder.path()), HostState{});
}

TEST(HostState, IsEmptyWhereItCannotBeRead) {
  const test::TemporaryFolder folder;
  std::ofstream(folder.path("host-state.plist")) << "no property list <";
  EXPECT_EQ(loadHostState(folder.path()), HostState{});
}

TEST(HostState, IgnoresWhatIsNoIdentifier) {
  const test::TemporaryFolder folder;
  std::ofstream(folder.path("host-state.plist"))
      << "<plist><dict><key>Declined</key><array><integer>1</integer>"
         "<string>org.a</string></array><key>Offered</key><true/></dict></plist>";
  EXPECT_EQ(loadHostState(folder.path()), (HostState{{"org.a"}, {}}));
}

TEST(HostState, IsReadAsItWasSaved) {
  const test::TemporaryFolder folder;
  const HostState state = {{"org.a", "org.b"}, {"org.c"}};
  ASSERT_TRUE(saveHostState(folder.path(), state).ok());
  EXPECT_EQ(loadHostState(folder.path()), state);
}

TEST(HostState, ThatCannotBeSavedIsAnError) {
  const Status saved = saveHostState("/proc/no such folder", {});
  ASSERT_FALSE(saved.ok());
  EXPECT_NE(saved.error().text.find("host-state.plist"), std::string::npos);
}

TEST(HostState, RemovedIsEmpty) {
  const test::TemporaryFolder folder;
  ASSERT_TRUE(saveHostState(folder.path(), {{"org.a"}, {}}).ok());
  EXPECT_TRUE(removeHostState(folder.path()).ok());
  EXPECT_EQ(loadHostState(folder.path()), HostState{});
  EXPECT_TRUE(removeHostState(folder.path()).ok());
}

TEST(HostState, LearnsWhatTheUserDeleted) {
  HostState state;
  state.learnDeleted({"org.a"});
  EXPECT_EQ(state.declined, IdentifierSet{"org.a"});
}

TEST(HostState, DoesNotTakeAFailedInstallForADeletion) {
  HostState state;
  state.offered = {"org.a"};
  state.learnDeleted({"org.a"});
  EXPECT_TRUE(state.declined.empty());
}

}  // namespace
}  // namespace appsync::tools
