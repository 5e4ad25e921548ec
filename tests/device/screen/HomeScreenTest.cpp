#include <chrono>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include <gtest/gtest.h>

#include "device/screen/HomeScreen.h"
#include "kit/fakes/FakeAppRegistry.h"
#include "plist/PropertyList.h"
#include "tests/support/ServiceDatabase.h"

namespace appsync::test {
namespace {

using device::AssertionAnswer;
using device::HomeScreen;
using device::Settings;
using platform::TerminationAssertionOutcome;
using Identifiers = std::vector<std::string>;

class HomeScreenTest : public testing::Test {
 protected:
  void setLayout(std::string_view text) { homeScreen.setIconState(port, bytesOf(text)); }
  void layOut(const plist::Value& layout) {
    const auto document = plist::writeBinary(layout);
    ASSERT_TRUE(document);
    homeScreen.setIconState(port, *document);
  }
  Identifiers order() { return orderOf(homeScreen); }
  Identifiers orderOf(HomeScreen& screen) const {
    const auto state = screen.getFlattenedIconState(port, 1);
    EXPECT_TRUE(state);
    const auto root = plist::readBinary(state.value_or(Bytes()));
    EXPECT_TRUE(root && root->array() != nullptr);
    Identifiers identifiers;
    for (const plist::Value& element : *root->array())
      identifiers.emplace_back(element.string().value_or("no string"));
    return identifiers;
  }
  TerminationAssertionOutcome ask(std::string_view identifier, bool isHeld) {
    auto outcome = TerminationAssertionOutcome{77};
    const auto assertion = homeScreen.terminationAssertionCreate(identifier, 0, outcome);
    EXPECT_EQ(assertion != nullptr, isHeld);
    return outcome;
  }

  CallJournal journal;
  FakeFileSystem files{journal};
  FakeUninstalledAppsList uninstalled{journal};
  FakeAppRegistry registry{journal, files, uninstalled};
  ServiceDatabase<Settings, HomeScreen> database;
  Settings settings{database};
  HomeScreen homeScreen{database, registry, settings};
  const HomeScreen::Port port = homeScreen.blockableServerPort();
};

TEST_F(HomeScreenTest, OrderOfEmptyDeviceIsEmpty) {
  EXPECT_EQ(order(), Identifiers{});
}

TEST_F(HomeScreenTest, UsesRegistryOrderWithoutLayout) {
  registry.add(FakeApp::installed("com.a"));
  registry.add(FakeApp::placeholder("com.b"));
  registry.add(FakeApp::installed("com.c").ofType(platform::kApplicationTypeSystem));
  registry.addBundle("com.extension", platform::BundleKind::user);
  EXPECT_EQ(order(), (Identifiers{"com.a", "com.b", "com.c"}));
}

TEST_F(HomeScreenTest, LayoutComesFirstEvenForMissingApps) {
  for (const char* identifier : {"com.a", "com.b", "com.c"})
    registry.add(FakeApp::installed(identifier));
  setLayout("(com.c, com.new, com.a)");
  EXPECT_EQ(order(), (Identifiers{"com.c", "com.new", "com.a", "com.b"}));
}

TEST_F(HomeScreenTest, FlattensPagesAndFolders) {
  setLayout(R"(((com.a, com.b), (com.c, {displayName = Games; iconLists = ((com.d), (com.e, com.f));}, com.g)))");
  EXPECT_EQ(order(), (Identifiers{"com.a", "com.b", "com.c", "com.d", "com.e", "com.f", "com.g"}));
}

TEST_F(HomeScreenTest, AcceptsDictionaryWithIconLists) {
  setLayout("{iconLists = ((com.b), (com.a)); other = (com.x);}");
  EXPECT_EQ(order(), (Identifiers{"com.b", "com.a"}));
}

TEST_F(HomeScreenTest, AcceptsEveryPropertyListFormat) {
  setLayout("<?xml version=\"1.0\"?><plist version=\"1.0\"><array><string>com.x</string></array></plist>");
  EXPECT_EQ(order(), Identifiers{"com.x"});
  layOut(plist::Array{"com.y"});
  EXPECT_EQ(order(), Identifiers{"com.y"});
}

TEST_F(HomeScreenTest, IgnoresRepeatedIdentifiers) {
  setLayout("(com.a, com.b, (com.a), com.c, com.b)");
  EXPECT_EQ(order(), (Identifiers{"com.a", "com.b", "com.c"}));
}

TEST_F(HomeScreenTest, IgnoresInvalidIdentifiers) {
  layOut(plist::Array{"com.a", "", "../evil", "com/b", "a b", ".hidden", std::string(201, 'x'), "\xc3\xa9", 5, true,
                      plist::Value::data(bytesOf("com.c")), plist::Dictionary{{"iconLists", "com.d"}},
                      plist::Dictionary{{"name", "com.e"}}, plist::Array{}, "com.b_-2"});
  EXPECT_EQ(order(), (Identifiers{"com.a", "com.b_-2"}));
}

TEST_F(HomeScreenTest, UnusableLayoutChangesNothing) {
  setLayout("(com.a)");
  for (const std::string_view useless :
       {"", "garbage \x01", "com.b", "()", "((), ({iconLists = ();}))", "{other = (com.b);}", "bplist00", "(com.b"}) {
    setLayout(useless);
    EXPECT_EQ(order(), Identifiers{"com.a"}) << useless;
  }
}

TEST_F(HomeScreenTest, AcceptsDeepestLayout) {
  plist::Value layout = plist::Array{"com.deep"};
  for (int depth = 2; depth < plist::kMaximumDepth; ++depth)
    layout = plist::Array{layout};
  layOut(layout);
  EXPECT_EQ(order(), Identifiers{"com.deep"});
}

TEST_F(HomeScreenTest, ReplacesLayout) {
  setLayout("(com.a, com.b, com.c)");
  setLayout("(com.b)");
  EXPECT_EQ(order(), Identifiers{"com.b"});
}

TEST_F(HomeScreenTest, LayoutSurvivesRestartAndIsReadable) {
  setLayout("(com.b, com.a)");
  const auto reader = database.openReadOnly();
  Settings readersSettings(*reader);
  HomeScreen readers(*reader, registry, readersSettings);
  readers.setIconState(port, bytesOf("(com.x)"));
  EXPECT_EQ(orderOf(readers), (Identifiers{"com.b", "com.a"}));
  database.reopen();
  HomeScreen reopened(database, registry, settings);
  EXPECT_EQ(orderOf(reopened), (Identifiers{"com.b", "com.a"}));
}

TEST_F(HomeScreenTest, ReturnsNulloptForOtherFormats) {
  EXPECT_EQ(homeScreen.getFlattenedIconState(port, 0), std::nullopt);
  EXPECT_EQ(homeScreen.getFlattenedIconState(port, 2), std::nullopt);
}

TEST_F(HomeScreenTest, ReturnsNulloptIfDatabaseIsUnreadable) {
  database.drop("icon_layout");
  EXPECT_EQ(homeScreen.getFlattenedIconState(port, 1), std::nullopt);
  EXPECT_FALSE(homeScreen.iconOrder());
  setLayout("(com.a)");
}

TEST_F(HomeScreenTest, OrdersTenThousandIconsAndApps) {
  plist::Array layout;
  Identifiers expected;
  for (int number = 0; number < 10'000; ++number)
    expected.push_back("com.laid-out." + std::to_string(99'999 - number));
  for (const std::string& identifier : expected)
    layout.emplace_back(identifier);
  for (int number = 10'000; number < 20'000; ++number) {
    expected.push_back("com.other." + std::to_string(number));
    registry.add(FakeApp::installed(expected.back()));
  }
  layOut(plist::Value(std::move(layout)));
  EXPECT_EQ(order(), expected);
}

TEST_F(HomeScreenTest, GrantsAssertionForAppAndPlaceholder) {
  registry.add(FakeApp::installed("com.a"));
  registry.add(FakeApp::placeholder("com.b"));
  EXPECT_EQ(ask("com.a", true), TerminationAssertionOutcome::granted);
  EXPECT_EQ(ask("com.b", true), TerminationAssertionOutcome::granted);
}

TEST_F(HomeScreenTest, SettingOverridesAnswer) {
  registry.add(FakeApp::installed("com.a"));
  registry.add(FakeApp::installed("com.b"));
  const auto answer = [&](AssertionAnswer given) { EXPECT_TRUE(settings.setAssertionAnswer("com.a", given)); };
  answer(AssertionAnswer::denied);
  EXPECT_EQ(ask("com.a", false), TerminationAssertionOutcome::denied);
  EXPECT_EQ(ask("com.b", true), TerminationAssertionOutcome::granted);
  answer(AssertionAnswer::unknown);
  EXPECT_EQ(ask("com.a", false), TerminationAssertionOutcome::notFound);
  answer(AssertionAnswer::failing);
  EXPECT_EQ(ask("com.a", false), TerminationAssertionOutcome{3});
  answer(AssertionAnswer::granted);
  EXPECT_EQ(ask("com.a", true), TerminationAssertionOutcome::granted);
  EXPECT_TRUE(settings.assign("assertion=com.a:unset"));
  EXPECT_EQ(ask("com.a", true), TerminationAssertionOutcome::granted);
}

TEST_F(HomeScreenTest, SettingGrantsAssertionForUnknownApp) {
  EXPECT_TRUE(settings.setAssertionAnswer("com.x", AssertionAnswer::granted));
  EXPECT_EQ(ask("com.x", true), TerminationAssertionOutcome::granted);
}

TEST_F(HomeScreenTest, GrantsSeveralAssertionsForApp) {
  registry.add(FakeApp::installed("com.a"));
  auto outcome = TerminationAssertionOutcome::denied;
  const auto first = homeScreen.terminationAssertionCreate("com.a", 0, outcome);
  const auto second = homeScreen.terminationAssertionCreate("com.a", 0, outcome);
  EXPECT_NE(first, nullptr);
  EXPECT_NE(second, nullptr);
}

}  // namespace
}  // namespace appsync::test
