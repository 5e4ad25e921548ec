// Runs the contract suites of this port's services.
//
// A subject gives a suite access to a service and to its other side: it removes an app, or reads the log back. Each
// test gets a new subject in its initial state.
#include <filesystem>
#include <fstream>
#include <memory>
#include <optional>
#include <sstream>
#include <string>
#include <string_view>
#include <vector>

#include "RemovedApps.h"
#include "TextTransactionLog.h"
#include "kit/contracts/TransactionLogContract.h"
#include "kit/contracts/UninstalledAppsListContract.h"
#include "kit/fakes/FakePlatform.h"
#include "kit/fakes/TemporaryFolder.h"

// The suites are instantiated in their own namespace.
namespace appsync::test {

namespace {

class RemovedAppsSubject final : public UninstalledAppsListSubject {
 public:
  platform::UninstalledAppsList& list() override { return *list_; }
  void removeRealApp(std::string_view identifier) override { EXPECT_EQ(list_->add(identifier), 0); }
  void installApp(std::string_view identifier) override { EXPECT_EQ(list_->remove(identifier), 0); }
  bool failClearing() override { return std::filesystem::create_directory(folder_.path("removed-apps.txt.new")); }
  bool restart() override {
    list_ = open();
    return true;
  }

 private:
  [[nodiscard]] std::unique_ptr<port::RemovedApps> open() const {
    return std::make_unique<port::RemovedApps>(folder_.path("removed-apps.txt"));
  }

  const TemporaryFolder folder_;
  std::unique_ptr<port::RemovedApps> list_ = open();
};

class TextLogSubject final : public TransactionLogSubject {
 public:
  platform::TransactionLog& log() override { return log_; }
  platform::SystemLog& systemLog() override { return device_.systemLogs; }

  std::vector<KeptEntry> entries() override {
    std::vector<KeptEntry> entries;
    std::ifstream file(path_);
    for (std::string line; std::getline(file, line);)
      entries.push_back(entryIn(line));
    return entries;
  }

 private:
  static std::string unescaped(std::string_view text) {
    std::string original;
    for (std::size_t at = 0; at < text.size(); ++at) {
      const bool isEscape = text[at] == '\\' && at + 1 < text.size();
      if (isEscape) ++at;
      original += !isEscape ? text[at] : text[at] == 't' ? '\t' : text[at] == 'n' ? '\n' : text[at];
    }
    return original;
  }

  static KeptEntry entryIn(const std::string& line) {
    std::istringstream fields(line);
    const auto text = [&] {
      std::string field;
      std::getline(fields, field, '\t');
      return unescaped(field);
    };
    const auto number = [&] { return static_cast<std::uint32_t>(std::stoul(text())); };
    KeptEntry entry;
    if (text() == "step") {
      entry.step = number();
      entry.party = platform::TransactionParty{number()};
      entry.phase = platform::TransactionPhase{number()};
    } else {
      entry.scenario = text();
      entry.step = number();
    }
    entry.success = text() == "ok";
    entry.bundleIdentifier = text();
    entry.description = text();
    return entry;
  }

  const TemporaryFolder folder_;
  const std::string path_ = folder_.path("transactions.txt");
  FakePlatform device_;  // For its system log; the port implements none.
  port::TextTransactionLog log_{path_};
};

}  // namespace

INSTANTIATE_TEST_SUITE_P(Port, UninstalledAppsListContract,
                         testing::Values(implementation<UninstalledAppsListSubject, RemovedAppsSubject>("File")),
                         implementationName);
INSTANTIATE_TEST_SUITE_P(Port, TransactionLogContract,
                         testing::Values(implementation<TransactionLogSubject, TextLogSubject>("Text")),
                         implementationName);

}  // namespace appsync::test
