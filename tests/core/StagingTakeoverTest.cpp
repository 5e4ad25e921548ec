// What is at the paths of the work area and the staging folder when a sync begins.
#include <cerrno>
#include <optional>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

#include <gtest/gtest.h>

#include "kit/fakes/SyncFileBuilder.h"
#include "tests/support/ClientFixture.h"

namespace appsync::test {

namespace {

constexpr std::string_view kStaging = "/var/mobile/Media/PublicStaging/ApplicationSync";
constexpr std::string_view kWorkArea = "/var/mobile/Library/ApplicationSync/HarvoStuff";

class StagingTakeover : public ClientFixture {
 protected:
  AppsClient& client = makeClient();
  std::optional<Error> error;

  void stage(plist::Array todoList) { putPropertyList(platform.files, kStagedTodoListPath, std::move(todoList)); }
  bool reconcile() { return client.reconcileSync({}, "anchor", nullptr, &error); }
};

}  // namespace

TEST_F(StagingTakeover, IgnoresThatNoWorkAreaCanBeRemoved) {
  EXPECT_TRUE(reconcile());
  EXPECT_FALSE(error);
}

TEST_F(StagingTakeover, RemovesDanglingLinkAtWorkArea) {
  stage({installEntry("com.a")});
  platform.files.putLink(kWorkArea, "/var/mobile/missing");
  EXPECT_TRUE(reconcile());
  EXPECT_FALSE(error);
  EXPECT_EQ(propertyListAt(platform.files, kTodoListPath), plist::Value(plist::Array{installEntry("com.a")}));
  EXPECT_FALSE(platform.files.has("/var/mobile/missing"));
}

TEST_F(StagingTakeover, RemovesLinkAtWorkAreaAndKeepsItsTarget) {
  stage({});
  platform.files.put("/var/mobile/Library/Kept/file", "kept");
  platform.files.putLink(kWorkArea, "/var/mobile/Library/Kept");
  EXPECT_TRUE(reconcile());
  EXPECT_EQ(platform.files.paths("/var/mobile/Library/Kept"),
            std::vector<std::string>{"/var/mobile/Library/Kept/file"});
}

TEST_F(StagingTakeover, RefusesStagedItemThatIsNoFolder) {
  platform.files.put(kStaging, "no folder");
  EXPECT_FALSE(reconcile());
  EXPECT_EQ(error, Error::fromErrno(ENOTDIR, kStaging));
  EXPECT_TRUE(sameLines(LogLines{logged("starting to reconcile sync with new anchor anchor"),
                                 logged("Can't move staging area"), logged("finished reconcile sync")},
                        platform.log.lines()));
  EXPECT_EQ(platform.files.text(kStaging), "no folder");
  EXPECT_FALSE(platform.files.has(kWorkArea));
  EXPECT_TRUE(platform.notify.posts().empty());
}

TEST_F(StagingTakeover, RefusesStagedItemOfUnknownKind) {
  stage({removeEntry("com.a")});
  const Error denied = Error::fromErrno(EACCES, kStaging);
  platform.files.failures.failNext(FileOperation::attributesOfItem, kStaging, denied);
  EXPECT_FALSE(reconcile());
  EXPECT_EQ(error, denied);
  EXPECT_TRUE(platform.log.contains(logged("Can't move staging area")));
  EXPECT_TRUE(platform.files.has(kStagedTodoListPath));
}

}  // namespace appsync::test
