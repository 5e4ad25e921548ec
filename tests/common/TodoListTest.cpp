// The host's todo list: loading, finding, changing, saving.
#include <optional>
#include <utility>

#include <gtest/gtest.h>

#include "common/TodoList.h"
#include "kit/fakes/SyncFileBuilder.h"
#include "kit/fakes/TextDiff.h"
#include "platform/SyncFiles.h"
#include "tests/support/ClientFixture.h"

namespace appsync::test {

namespace {

const plist::Array& oddList() {
  static const plist::Array kList{"com.a",
                                  plist::Dictionary{{"identifier", 7}},
                                  plist::Dictionary{},
                                  entry("com.a", "first"),
                                  entry("com.b", "only"),
                                  entry("com.a", "second"),
                                  entry("", "empty"),
                                  entry("..", "dots")};
  return kList;
}

}  // namespace

TEST(TodoFind, ReturnsFirstDictionaryWithIdentifier) {
  const plist::Array& list = oddList();
  EXPECT_EQ(todo::find(list, "com.a"), &list[3]);
  EXPECT_EQ(todo::find(list, "com.b"), &list[4]);
  EXPECT_EQ(todo::find(list, ""), &list[6]);
  EXPECT_EQ(todo::find(list, ".."), &list[7]);
}

TEST(TodoFind, ReturnsNullForUnknownIdentifier) {
  EXPECT_EQ(todo::find(oddList(), "com.A"), nullptr);
  EXPECT_EQ(todo::find(oddList(), "com"), nullptr);
  EXPECT_EQ(todo::find({}, "com.a"), nullptr);
}

TEST(TodoIndex, FindsTheSameEntriesAsFind) {
  const std::optional<plist::Array> list(oddList());
  const todo::Index index(list);
  for (const char* identifier : {"com.a", "com.b", "", "..", "com.A", "com", "identifier"})
    EXPECT_EQ(index.find(identifier), todo::find(*list, identifier)) << identifier;
}

TEST(TodoIndex, FindsNothingInEmptyOrAbsentList) {
  const std::optional<plist::Array> empty(std::in_place);
  const std::optional<plist::Array> absent;
  EXPECT_EQ(todo::Index(empty).find("com.a"), nullptr);
  EXPECT_EQ(todo::Index(absent).find("com.a"), nullptr);
}

class TodoList : public ::testing::Test {
 protected:
  std::optional<plist::Array> load() { return todo::load(platform.files, kTodoListPath, log, nullptr); }

  FakePlatform platform;
  const PlugInLog log{platform.framework};
};

TEST_F(TodoList, SetsOperationOfFirstEntryOnly) {
  plist::Array list = oddList();
  EXPECT_TRUE(todo::setOperation(list, "com.a", todo::kSent, log));
  EXPECT_EQ(list[3], plist::Value(entry("com.a", "SENT")));
  EXPECT_EQ(list[5], oddList()[5]);
  EXPECT_TRUE(sameLines(LogLines{logged("Changing com.a from first to SENT")}, platform.log.lines()));
}

TEST_F(TodoList, LeavesListWithoutEntryUnchanged) {
  plist::Array list = oddList();
  EXPECT_FALSE(todo::setOperation(list, "com.unknown", todo::kSent, log));
  EXPECT_EQ(list, oddList());
  EXPECT_TRUE(platform.log.lines().empty());
}

TEST_F(TodoList, LoadsWhatWasSaved) {
  platform.files.put(kTodoListPath, binaryForm(plist::Array{}));
  EXPECT_TRUE(todo::save(platform.files, kTodoListPath, oddList()));
  EXPECT_EQ(load(), oddList());
}

TEST_F(TodoList, FailsToSaveListWithNull) {
  platform.files.put(kTodoListPath, binaryForm(oddList()));
  EXPECT_FALSE(todo::save(platform.files, kTodoListPath, plist::Array{plist::Value()}));
  EXPECT_EQ(load(), oddList());
}

}  // namespace appsync::test
