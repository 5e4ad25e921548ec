// The transaction log, as a text file.
#pragma once

#include <cstdint>
#include <fstream>
#include <memory>
#include <mutex>
#include <string>
#include <string_view>

#include "platform/TransactionLog.h"

namespace port {

/// Appends one line per entry, with fields separated by tabs:
///
///     step      STEP      PARTY  PHASE  ok|failed  IDENTIFIER  DESCRIPTION
///     scenario  SCENARIO  STEP          ok|failed  IDENTIFIER  DESCRIPTION
///
/// In texts, backslash, tab and newline are written as \\, \t and \n, so that each entry is one line. An entry that
/// cannot be written is lost, as the contract allows.
class TextTransactionLog final : public appsync::platform::TransactionLog {
 public:
  explicit TextTransactionLog(const std::string& path) : file_(path, std::ios::app) {}

  void initializeWithLog(std::shared_ptr<appsync::platform::SystemLogHandle> log) override;
  void logStep(appsync::platform::TransactionStep step, appsync::platform::TransactionParty party,
               appsync::platform::TransactionPhase phase, bool success, std::string_view bundleIdentifier,
               std::string_view description) override;
  void logScenario(std::string_view scenario, std::uint32_t step, bool success, std::string_view bundleIdentifier,
                   std::string_view description) override;

 private:
  void append(const std::string& line);

  std::mutex mutex_;  // The plug-in installs up to ten apps concurrently.
  std::shared_ptr<appsync::platform::SystemLogHandle> log_;
  std::ofstream file_;
};

}  // namespace port
