#include "kit/contracts/BundlesContract.h"

#include "kit/fakes/Threads.h"
#include "plist/PropertyList.h"

namespace appsync::test {

GTEST_ALLOW_UNINSTANTIATED_PARAMETERIZED_TEST(BundlesContract);

namespace {

constexpr std::string_view kInfo =
    "<plist><dict><key>Name</key><string>An app</string><key>Number</key>"
    "<integer>7</integer></dict></plist>";

}  // namespace

TEST_P(BundlesContract, ReadsTheInfoDictionary) {
  const auto bundle = openWithInfo(kInfo);
  ASSERT_NE(bundle, nullptr);
  const plist::Value* name = bundle->infoDictionaryValue("Name");
  const plist::Value* number = bundle->infoDictionaryValue("Number");
  ASSERT_NE(name, nullptr);
  ASSERT_NE(number, nullptr);
  EXPECT_EQ(*name, plist::Value("An app"));
  EXPECT_EQ(*number, plist::Value(7));
}

TEST_P(BundlesContract, ReadsABinaryInfoDictionary) {
  const Bytes binary = plist::writeBinary(plist::Dictionary{{"Name", "An app"}}).value();
  const auto bundle = openWithInfo(textOf(binary));
  ASSERT_NE(bundle, nullptr);
  ASSERT_NE(bundle->infoDictionaryValue("Name"), nullptr);
  EXPECT_EQ(*bundle->infoDictionaryValue("Name"), plist::Value("An app"));
}

TEST_P(BundlesContract, MissingKeyReturnsNull) {
  const auto bundle = openWithInfo(kInfo);
  ASSERT_NE(bundle, nullptr);
  EXPECT_EQ(bundle->infoDictionaryValue("Other"), nullptr);
  EXPECT_EQ(bundle->infoDictionaryValue("name"), nullptr);
  EXPECT_EQ(bundle->infoDictionaryValue(""), nullptr);
}

TEST_P(BundlesContract, ValuesLiveAsLongAsTheBundle) {
  const auto bundle = openWithInfo(kInfo);
  ASSERT_NE(bundle, nullptr);
  const plist::Value* name = bundle->infoDictionaryValue("Name");
  subject().put(subject().folder() + "/App.app/Info.plist", "changed");
  EXPECT_EQ(bundle->infoDictionaryValue("Name"), name);
  EXPECT_EQ(*name, plist::Value("An app"));
}

TEST_P(BundlesContract, ReturnsItsLocation) {
  const auto bundle = openWithInfo(kInfo);
  ASSERT_NE(bundle, nullptr);
  EXPECT_EQ(bundle->location().path, subject().folder() + "/App.app");
  EXPECT_TRUE(bundle->location().isDirectory);
}

TEST_P(BundlesContract, MissingDirectoryReturnsNull) {
  EXPECT_EQ(subject().bundles().openBundle({subject().folder() + "/Missing.app", true}), nullptr);
}

TEST_P(BundlesContract, FileReturnsNull) {
  subject().put(subject().folder() + "/File.app", "x");
  EXPECT_EQ(subject().bundles().openBundle({subject().folder() + "/File.app", true}), nullptr);
}

TEST_P(BundlesContract, MissingInfoDictionaryIsEmpty) {
  const auto bundle = subject().bundles().openBundle({subject().folder(), true});
  ASSERT_NE(bundle, nullptr);
  EXPECT_EQ(bundle->infoDictionaryValue("Name"), nullptr);
}

TEST_P(BundlesContract, InvalidInfoDictionaryIsEmpty) {
  for (const char* info : {"", "garbage <", "bplist00", "<plist><array/></plist>"}) {
    const auto bundle = openWithInfo(info);
    ASSERT_NE(bundle, nullptr) << info;
    EXPECT_EQ(bundle->infoDictionaryValue("Name"), nullptr) << info;
  }
}

TEST_P(BundlesContract, OpensAndReadsConcurrently) {
  const auto shared = openWithInfo(kInfo);
  ASSERT_NE(shared, nullptr);
  runOnThreads(8, [&](std::size_t) {
    const auto own = subject().bundles().openBundle(shared->location());
    ASSERT_NE(own, nullptr);
    for (const platform::Bundle* bundle : {shared.get(), own.get()}) {
      const plist::Value* name = bundle->infoDictionaryValue("Name");
      ASSERT_NE(name, nullptr);
      EXPECT_EQ(*name, plist::Value("An app"));
    }
  });
}

TEST_P(BundlesContract, MainBundleIdentifierDoesNotChange) {
  EXPECT_EQ(subject().bundles().mainBundleIdentifier(), subject().bundles().mainBundleIdentifier());
}

}  // namespace appsync::test
