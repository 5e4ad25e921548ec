#include "TextTransactionLog.h"

#include <utility>

namespace port {

namespace {

std::string escaped(std::string_view text) {
  std::string line;
  for (const char character : text) {
    switch (character) {
      case '\\':
        line += "\\\\";
        break;
      case '\t':
        line += "\\t";
        break;
      case '\n':
        line += "\\n";
        break;
      default:
        line += character;
    }
  }
  return line;
}

template <class Enumeration>
std::string number(Enumeration value) {
  return std::to_string(static_cast<std::uint32_t>(value));
}

/// Returns the last fields of both kinds of entries.
std::string outcome(bool success, std::string_view bundleIdentifier, std::string_view description) {
  return (success ? "ok\t" : "failed\t") + escaped(bundleIdentifier) + "\t" + escaped(description) + "\n";
}

}  // namespace

void TextTransactionLog::initializeWithLog(std::shared_ptr<appsync::platform::SystemLogHandle> log) {
  const std::scoped_lock lock(mutex_);
  log_ = std::move(log);  // The plug-in keeps no share of the handle.
}

void TextTransactionLog::logStep(appsync::platform::TransactionStep step, appsync::platform::TransactionParty party,
                                 appsync::platform::TransactionPhase phase, bool success,
                                 std::string_view bundleIdentifier, std::string_view description) {
  append("step\t" + number(step) + "\t" + number(party) + "\t" + number(phase) + "\t" +
         outcome(success, bundleIdentifier, description));
}

void TextTransactionLog::logScenario(std::string_view scenario, std::uint32_t step, bool success,
                                     std::string_view bundleIdentifier, std::string_view description) {
  append("scenario\t" + escaped(scenario) + "\t" + std::to_string(step) + "\t" +
         outcome(success, bundleIdentifier, description));
}

void TextTransactionLog::append(const std::string& line) {
  const std::scoped_lock lock(mutex_);
  file_.clear();  // A failed write, such as on a full disk, must not disable the log.
  file_ << line << std::flush;
}

}  // namespace port
