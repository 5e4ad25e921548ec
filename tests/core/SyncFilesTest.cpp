// Reading the files through which host and plug-in meet.
#include <cerrno>
#include <optional>
#include <string>
#include <string_view>

#include <gtest/gtest.h>

#include "kit/fakes/SyncFileBuilder.h"
#include "kit/fakes/TextDiff.h"
#include "platform/SyncFiles.h"
#include "tests/support/ClientFixture.h"

namespace appsync::test {

namespace {

constexpr std::string_view kPath = "/var/mobile/Library/ApplicationSync/Anything.plist";

class LoadPlist : public ClientFixture {
 protected:
  std::optional<plist::Array> load() { return AppsClient::_loadPlist(platform, kPath, &error); }

  std::optional<Error> error;
};

const plist::Array& twoEntries() {
  static const plist::Array kEntries{installEntry("com.a"), removeEntry("com.b")};
  return kEntries;
}

}  // namespace

TEST_F(LoadPlist, AnAbsentFileIsNoListAndNoMessage) {
  EXPECT_FALSE(load());
  ASSERT_TRUE(error);
  EXPECT_EQ(error->domain, "POSIX");
  EXPECT_EQ(error->code, ENOENT);
  EXPECT_TRUE(platform.log.lines().empty());
}

TEST_F(LoadPlist, AnUnreadableFileIsNoListAndNoMessage) {
  platform.files.put(kPath, xmlForm(twoEntries()));
  platform.files.failures.failNext(FileOperation::readFile, kPath, Error::fromErrno(EIO, kPath));
  EXPECT_FALSE(load());
  EXPECT_EQ(error, Error::fromErrno(EIO, kPath));
  EXPECT_TRUE(platform.log.lines().empty());
}

TEST_F(LoadPlist, AnEmptyFileIsNoListAndNoMessage) {
  platform.files.put(kPath, "");
  EXPECT_FALSE(load());
  EXPECT_FALSE(error);
  EXPECT_TRUE(platform.log.lines().empty());
}

TEST_F(LoadPlist, AnUnparsableFileSaysSo) {
  platform.files.put(kPath, "\x01\x02 this is no list");
  EXPECT_FALSE(load());
  ASSERT_TRUE(error);
  EXPECT_EQ(error->domain, "PropertyList");
  EXPECT_TRUE(sameLines(LogLines{loggedError("couldn't parse todo list")}, platform.log.lines()));
}

TEST_F(LoadPlist, ATruncatedBinaryFileSaysSo) {
  const Bytes whole = binaryForm(twoEntries());
  platform.files.put(kPath, ByteView(whole).first(whole.size() - 5));
  EXPECT_FALSE(load());
  EXPECT_TRUE(error);
  EXPECT_TRUE(sameLines(LogLines{loggedError("couldn't parse todo list")}, platform.log.lines()));
}

TEST_F(LoadPlist, TheOldTextFormIsNotAccepted) {
  for (const char* text : {"( { identifier = com.a; operation = remove; } )", "word", "{ a = b; }"}) {
    platform.log.clear();
    error.reset();
    platform.files.put(kPath, text);
    EXPECT_FALSE(load()) << text;
    EXPECT_TRUE(error) << text;
    EXPECT_TRUE(sameLines(LogLines{loggedError("couldn't parse todo list")}, platform.log.lines())) << text;
  }
}

TEST_F(LoadPlist, AFileThatHoldsADictionarySaysSo) {
  putPropertyList(platform.files, kPath, plist::Dictionary{{"identifier", "com.a"}});
  EXPECT_FALSE(load());
  EXPECT_FALSE(error);
  EXPECT_TRUE(sameLines(LogLines{loggedError("todo list is not an array")}, platform.log.lines()));
}

TEST_F(LoadPlist, AFileThatHoldsAScalarSaysSo) {
  for (const plist::Value& root : {plist::Value("text"), plist::Value(7), plist::Value(true)}) {
    platform.log.clear();
    putPropertyList(platform.files, kPath, root);
    EXPECT_FALSE(load());
    EXPECT_TRUE(sameLines(LogLines{loggedError("todo list is not an array")}, platform.log.lines()));
  }
}

TEST_F(LoadPlist, AnEmptyArrayIsAList) {
  putPropertyList(platform.files, kPath, plist::Array{});
  const auto list = load();
  ASSERT_TRUE(list);
  EXPECT_TRUE(list->empty());
}

TEST_F(LoadPlist, TheXMLFormIsRead) {
  platform.files.put(kPath, xmlForm(twoEntries()));
  EXPECT_EQ(load(), twoEntries());
  EXPECT_FALSE(error);
}

TEST_F(LoadPlist, TheXMLFormIsReadAfterAByteOrderMarkOrBlanks) {
  const Bytes whole = xmlForm(twoEntries());
  const std::string xml(textOf(whole));
  platform.files.put(kPath, "\xEF\xBB\xBF" + xml);
  EXPECT_EQ(load(), twoEntries());
  platform.files.put(kPath, "\n \t" + xml.substr(xml.find("<plist")));
  EXPECT_EQ(load(), twoEntries());
}

TEST_F(LoadPlist, TheBinaryFormIsRead) {
  platform.files.put(kPath, binaryForm(twoEntries()));
  EXPECT_EQ(load(), twoEntries());
  EXPECT_FALSE(error);
}

TEST_F(LoadPlist, TheContainersThatItReturnsCanBeChanged) {
  platform.files.put(kPath, binaryForm(twoEntries()));
  auto list = load();
  ASSERT_TRUE(list);
  list->at(0).dictionary()->set("operation", "SENT");
  list->pop_back();
  EXPECT_EQ(*list, plist::Array{[] {
    auto entry = installEntry("com.a");
    entry.set("operation", "SENT");
    return entry;
  }()});
}

TEST_F(LoadPlist, TheErrorSlotMayBeAbsent) {
  EXPECT_FALSE(AppsClient::_loadPlist(platform, kPath, nullptr));
  platform.files.put(kPath, "<plist>");
  EXPECT_FALSE(AppsClient::_loadPlist(platform, kPath, nullptr));
}

TEST_F(LoadPlist, TheFileIsReadOnceAndNothingElseIsAsked) {
  platform.files.put(kPath, binaryForm(twoEntries()));
  EXPECT_TRUE(load());
  EXPECT_TRUE(sameLines({"fileSystem.readFile " + std::string(kPath)}, platform.journal.lines()));
}

}  // namespace appsync::test
