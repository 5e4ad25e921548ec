#include "cli/ReportText.h"

#include <algorithm>
#include <array>

#include "cli/Printable.h"

namespace appsync::cli {
namespace {

constexpr std::size_t kVerbColumns = 10;

std::string line(std::string_view verb, std::string_view rest) {
  return fitted(verb, kVerbColumns) + " " + std::string(rest);
}

std::string countOf(const host::AppOutcomes& outcomes, host::AppEvent event, std::string_view word) {
  const auto count =
      std::count_if(outcomes.begin(), outcomes.end(), [&](const host::AppOutcome& one) { return one.event == event; });
  return count == 0 ? std::string() : std::to_string(count) + " " + std::string(word);
}

}  // namespace

std::string shownName(const host::AppName& app) {
  std::string name = printable(app.name.empty() ? app.identifier : app.name, 60);
  if (!app.version.empty()) name += " " + printable(app.version, 20);
  return name;
}

std::string outcomeLine(const host::AppOutcome& outcome) {
  switch (outcome.event) {
    case host::AppEvent::installed:
    case host::AppEvent::updated:
    case host::AppEvent::removed:
    case host::AppEvent::restored:
      return line(host::wordFor(outcome.event), shownName(outcome.name));
    case host::AppEvent::skipped:
      return line("skipped", shownName(outcome.name) + ": " + printable(outcome.reason));
    case host::AppEvent::failed:
    case host::AppEvent::cutOff:
    case host::AppEvent::unchanged:
      break;
  }
  return {};
}

std::string failureSentence(const host::AppOutcome& outcome) {
  const std::string identifier = printable(outcome.name.identifier, 100);
  const std::string known = outcome.name.name.empty() ? "" : " (" + identifier + ")";
  return shownName(outcome.name) + known + " failed: " + printable(outcome.reason, 1000);
}

std::string waitingLine(const host::AppName& app, std::string_view reason) {
  return line("waiting", shownName(app) + ": " + printable(reason));
}

std::string summaryLine(const host::AppOutcomes& outcomes) {
  const std::string current = countOf(outcomes, host::AppEvent::unchanged, "up to date");
  const std::array<std::string, 7> done = {
      countOf(outcomes, host::AppEvent::installed, "installed"),
      countOf(outcomes, host::AppEvent::updated, "updated"),
      countOf(outcomes, host::AppEvent::removed, "removed"),
      countOf(outcomes, host::AppEvent::restored, "restored"),
      countOf(outcomes, host::AppEvent::failed, "failed"),
      countOf(outcomes, host::AppEvent::skipped, "skipped"),
      countOf(outcomes, host::AppEvent::cutOff, "interrupted, to be offered again at the next sync")};
  std::string summary;
  for (const std::string& part : done) {
    if (!part.empty()) summary += (summary.empty() ? "" : ", ") + part;
  }
  if (summary.empty()) return current.empty() ? "Nothing to do." : "Nothing to do: " + current + ".";
  return summary + (current.empty() ? "" : ", " + current) + ".";
}

}  // namespace appsync::cli
