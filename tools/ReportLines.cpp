#include "tools/ReportLines.h"

#include <algorithm>
#include <array>

#include "tools/Printable.h"

namespace appsync::tools {
namespace {

constexpr std::size_t kVerbColumns = 10;

std::string line(std::string_view verb, std::string_view rest) {
  return fitted(verb, kVerbColumns) + " " + std::string(rest);
}

std::string countOf(const AppOutcomes& outcomes, AppEvent event, std::string_view word) {
  const auto count =
      std::count_if(outcomes.begin(), outcomes.end(), [&](const AppOutcome& one) { return one.event == event; });
  return count == 0 ? std::string() : std::to_string(count) + " " + std::string(word);
}

}  // namespace

std::string shownName(const AppName& app) {
  std::string name = printable(app.name.empty() ? app.identifier : app.name, 60);
  if (!app.version.empty()) name += " " + printable(app.version, 20);
  return name;
}

std::string outcomeLine(const AppOutcome& outcome) {
  switch (outcome.event) {
    case AppEvent::installed:
    case AppEvent::updated:
    case AppEvent::removed:
    case AppEvent::restored:
      return line(wordFor(outcome.event), shownName(outcome.app));
    case AppEvent::skipped:
      return line("skipped", shownName(outcome.app) + ": " + printable(outcome.reason));
    case AppEvent::failed:
    case AppEvent::cutOff:
    case AppEvent::unchanged:
      break;
  }
  return {};
}

std::string failureSentence(const AppOutcome& outcome) {
  const std::string identifier = printable(outcome.app.identifier, 100);
  const std::string known = outcome.app.name.empty() ? "" : " (" + identifier + ")";
  return shownName(outcome.app) + known + " failed: " + printable(outcome.reason, 1000);
}

std::string waitingLine(const AppName& app, std::string_view reason) {
  return line("waiting", shownName(app) + ": " + printable(reason));
}

std::string summaryLine(const AppOutcomes& outcomes) {
  const std::string current = countOf(outcomes, AppEvent::unchanged, "up to date");
  const std::array<std::string, 7> done = {
      countOf(outcomes, AppEvent::installed, "installed"),
      countOf(outcomes, AppEvent::updated, "updated"),
      countOf(outcomes, AppEvent::removed, "removed"),
      countOf(outcomes, AppEvent::restored, "restored"),
      countOf(outcomes, AppEvent::failed, "failed"),
      countOf(outcomes, AppEvent::skipped, "skipped"),
      countOf(outcomes, AppEvent::cutOff, "cut off, to be offered again at the next sync")};
  std::string summary;
  for (const std::string& part : done) {
    if (!part.empty()) summary += (summary.empty() ? "" : ", ") + part;
  }
  if (summary.empty()) return current.empty() ? "Nothing to do." : "Nothing to do: " + current + ".";
  return summary + (current.empty() ? "" : ", " + current) + ".";
}

}  // namespace appsync::tools
