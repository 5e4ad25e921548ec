// Looking things up in the host's todo list.
#include <optional>
#include <utility>

#include <gtest/gtest.h>

#include "common/TodoList.h"
#include "kit/fakes/SyncFileBuilder.h"

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

TEST(FirstEntry, IsTheFirstDictionaryWithThatIdentifier) {
  const plist::Array& list = oddList();
  EXPECT_EQ(firstEntry(list, "com.a"), &list[3]);
  EXPECT_EQ(firstEntry(list, "com.b"), &list[4]);
  EXPECT_EQ(firstEntry(list, ""), &list[6]);
  EXPECT_EQ(firstEntry(list, ".."), &list[7]);
}

TEST(FirstEntry, IsNullForWhatIsNotThere) {
  EXPECT_EQ(firstEntry(oddList(), "com.A"), nullptr);
  EXPECT_EQ(firstEntry(oddList(), "com"), nullptr);
  EXPECT_EQ(firstEntry({}, "com.a"), nullptr);
}

TEST(TodoIndex, GivesTheSameAnswersAsAWalk) {
  const std::optional<plist::Array> list(oddList());
  const TodoIndex index(list);
  for (const char* identifier : {"com.a", "com.b", "", "..", "com.A", "com", "identifier"})
    EXPECT_EQ(index.firstEntry(identifier), firstEntry(*list, identifier)) << identifier;
}

TEST(TodoIndex, OfAnEmptyOrAbsentListKnowsNothing) {
  const std::optional<plist::Array> empty(std::in_place);
  const std::optional<plist::Array> absent;
  EXPECT_EQ(TodoIndex(empty).firstEntry("com.a"), nullptr);
  EXPECT_EQ(TodoIndex(absent).firstEntry("com.a"), nullptr);
}

}  // namespace appsync::test
