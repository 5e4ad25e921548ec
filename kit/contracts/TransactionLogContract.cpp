#include "kit/contracts/TransactionLogContract.h"

#include <map>
#include <memory>
#include <ostream>

#include "kit/fakes/Threads.h"

namespace appsync::test {

using platform::TransactionParty;
using platform::TransactionPhase;
using platform::TransactionStep;

GTEST_ALLOW_UNINSTANTIATED_PARAMETERIZED_TEST(TransactionLogContract);

static void PrintTo(const KeptEntry& entry, std::ostream* out) {
  *out << entry.scenario.value_or("step") << " " << entry.step << " " << entry.success << " " << entry.bundleIdentifier
       << " " << entry.description;
}

TEST_P(TransactionLogContract, HandleIsNeverNull) {
  EXPECT_NE(subject().systemLog().createHandle("subsystem", "category"), nullptr);
  EXPECT_NE(subject().systemLog().createHandle("", ""), nullptr);
}

TEST_P(TransactionLogContract, RecordsAScenarioCompletely) {
  initialize();
  subject().log().logScenario("Harvo Sync", 0, true, "com.a", "Uninstall succeeded");
  subject().log().logScenario("Asset install", 3, false, "com.b", "");
  EXPECT_EQ(subject().entries(),
            (std::vector<KeptEntry>{{0, "Harvo Sync", {}, {}, true, "com.a", "Uninstall succeeded"},
                                    {3, "Asset install", {}, {}, false, "com.b", ""}}));
}

TEST_P(TransactionLogContract, RecordsAStepCompletely) {
  initialize();
  subject().log().logStep(TransactionStep::uninstallApp, TransactionParty::syncClient, TransactionPhase::end, false,
                          "com.a", "it failed");
  EXPECT_EQ(subject().entries(),
            (std::vector<KeptEntry>{
                {7, {}, TransactionParty::syncClient, TransactionPhase::end, false, "com.a", "it failed"}}));
}

TEST_P(TransactionLogContract, TextsAreNeededDuringTheCallOnly) {
  initialize();
  {
    const std::string identifier(100, 'i');
    const std::string description(100, 'd');
    subject().log().logScenario(std::string(100, 's'), 0, true, identifier, description);
  }
  const std::vector<KeptEntry> entries = subject().entries();
  ASSERT_EQ(entries.size(), 1U);
  EXPECT_EQ(entries[0].scenario, std::string(100, 's'));
  EXPECT_EQ(entries[0].description, std::string(100, 'd'));
}

TEST_P(TransactionLogContract, RecordsTextsByteForByte) {
  initialize();
  const std::string text = "first\tline\\\nsecond 'line', \"quoted\"; \xC3\xA4 \\n %s ";
  subject().log().logStep(TransactionStep::installApp, TransactionParty::syncClient, TransactionPhase::begin, true,
                          text, text);
  subject().log().logScenario(text, 0, true, text, text);
  EXPECT_EQ(subject().entries(),
            (std::vector<KeptEntry>{{1, {}, TransactionParty::syncClient, TransactionPhase::begin, true, text, text},
                                    {0, text, {}, {}, true, text, text}}));
}

TEST_P(TransactionLogContract, LaterHandleReplacesTheFirst) {
  initialize();
  subject().log().logScenario("s", 0, true, "com.a", "before");
  initialize();
  subject().log().logScenario("s", 0, true, "com.a", "after");
  EXPECT_EQ(subject().entries().size(), 2U);
}

TEST_P(TransactionLogContract, EntriesOfOneThreadKeepTheirOrder) {
  initialize();
  constexpr std::uint32_t kEntries = 20;
  runOnThreads(6, [&](std::size_t index) {
    const std::string identifier = "com.a" + std::to_string(index);
    for (std::uint32_t step = 0; step < kEntries; ++step) {
      subject().log().logScenario("s", step, true, identifier, "");
    }
  });
  std::map<std::string, std::uint32_t> next;
  for (const KeptEntry& entry : subject().entries())
    EXPECT_EQ(entry.step, next[entry.bundleIdentifier]++);
  EXPECT_EQ(next.size(), 6U);
  for (const auto& [identifier, count] : next)
    EXPECT_EQ(count, kEntries) << identifier;
}

}  // namespace appsync::test
