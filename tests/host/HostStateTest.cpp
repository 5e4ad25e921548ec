#include <cerrno>
#include <filesystem>
#include <fstream>

#include <gtest/gtest.h>

#include "host/HostState.h"
#include "kit/fakes/TemporaryFolder.h"

namespace appsync::host {
namespace {

TEST(HostState, MissingFileIsEmptyState) {
  const test::TemporaryFolder folder;
  EXPECT_EQ(loadHostState(folder.path()).value(), HostState{});
}

TEST(HostState, InvalidFileIsAnError) {
  const test::TemporaryFolder folder;
  for (const char* document :
       {"", "no property list <", "(Declined)", "{Declined = org.a;}",
        "<plist><dict><key>Offered</key><array><string>org.a</string><true/></array></dict></plist>"}) {
    std::ofstream(folder.path("host-state.plist")) << document;
    const auto state = loadHostState(folder.path());
    ASSERT_FALSE(state.ok()) << document;
    EXPECT_TRUE(state.error().text.starts_with(folder.path("host-state.plist") + " is damaged (")) << document;
    EXPECT_TRUE(state.error().text.ends_with(
        "); replace it with a good copy, or remove it: apps that were deleted are then sent again"))
        << document;
  }
}

TEST(HostState, UnreadableFileIsAnError) {
  const test::TemporaryFolder folder;
  std::filesystem::create_directory(folder.path("host-state.plist"));
  EXPECT_EQ(loadHostState(folder.path()).error(),
            (Error{std::string(domains::kPOSIX), EISDIR,
                   Error::fromErrno(EISDIR, folder.path("host-state.plist") + " cannot be read").text +
                       "; replace it with a good copy, or remove it: apps that were deleted are then sent again",
                   nullptr}));
}

TEST(HostState, MissingArraysAreEmpty) {
  const test::TemporaryFolder folder;
  std::ofstream(folder.path("host-state.plist")) << "{Declined = (org.a);}";
  EXPECT_EQ(loadHostState(folder.path()).value(), (HostState{{"org.a"}, {}}));
}

TEST(HostState, LoadsSavedState) {
  const test::TemporaryFolder folder;
  const HostState state = {{"org.a", "org.b"}, {"org.c"}};
  ASSERT_TRUE(saveHostState(folder.path(), state).ok());
  EXPECT_EQ(loadHostState(folder.path()).value(), state);
}

TEST(HostState, FailsIfItCannotBeSaved) {
  const Status saved = saveHostState("/proc/no such folder", {});
  ASSERT_FALSE(saved.ok());
  EXPECT_NE(saved.error().text.find("host-state.plist"), std::string::npos);
}

TEST(HostState, IsEmptyAfterRemoval) {
  const test::TemporaryFolder folder;
  ASSERT_TRUE(saveHostState(folder.path(), {{"org.a"}, {}}).ok());
  EXPECT_TRUE(removeHostState(folder.path()).ok());
  EXPECT_EQ(loadHostState(folder.path()).value(), HostState{});
  EXPECT_TRUE(removeHostState(folder.path()).ok());
}

TEST(HostState, AddsDeletedApps) {
  HostState state;
  state.addDeleted({"org.a"});
  EXPECT_EQ(state.declined, IdentifierSet{"org.a"});
}

TEST(HostState, FailedInstallIsNotADeletion) {
  HostState state;
  state.offered = {"org.a"};
  state.addDeleted({"org.a"});
  EXPECT_TRUE(state.declined.empty());
}

}  // namespace
}  // namespace appsync::host
