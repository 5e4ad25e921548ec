#include <vector>

#include "cli/Json.h"
#include "cli/Reporters.h"

namespace appsync::cli {
namespace {

/// Returns the possible outcomes of an app.
std::vector<host::AppEvent> outcomesOf(host::OperationKind operation) {
  if (operation == host::OperationKind::restore)
    return {host::AppEvent::restored, host::AppEvent::failed, host::AppEvent::skipped};
  return {host::AppEvent::installed, host::AppEvent::updated, host::AppEvent::removed, host::AppEvent::failed,
          host::AppEvent::skipped};
}

/// Writes lines such as `{"event":"progress","identifier":…,"fraction":…}` and flushes each.
class JsonReporter final : public host::SyncReporter {
 public:
  JsonReporter(StandardOutput& output, host::OperationKind operation) : output_(output), operation_(operation) {}

  void progressed(const host::AppProgress& progress) override {
    write({{"event", "progress"}, {"identifier", progress.name.identifier}, {"fraction", progress.fraction}});
  }

  void waits(const host::AppName& app, std::string_view reason) override {
    write({{"event", "waiting"}, {"identifier", app.identifier}, {"reason", std::string(reason)}});
  }

  void interrupted() override { printError(kInterruptedNotice); }
  void warned(std::string_view sentence) override { printError(sentence); }

  void finished(const host::AppOutcome& outcome) override {
    Json line = {{"event", std::string(host::wordFor(outcome.event))}, {"identifier", outcome.name.identifier}};
    if (!outcome.name.name.empty()) line["name"] = outcome.name.name;
    if (!outcome.name.version.empty()) line["version"] = outcome.name.version;
    if (!outcome.reason.empty()) line["reason"] = outcome.reason;
    write(line);
  }

  void summarise(const host::AppOutcomes& outcomes) override {
    Json line = {{"event", "summary"}};
    for (const host::AppEvent event : outcomesOf(operation_))
      line[std::string(host::wordFor(event))] = Json::array();
    for (const host::AppOutcome& outcome : outcomes) {
      line[std::string(host::wordFor(outcome.event))].push_back(outcome.name.identifier);
    }
    write(line);
  }

 private:
  void write(const Json& line) {
    output_.writeLine(onOneLine(line));
    output_.flush();
  }

  StandardOutput& output_;
  const host::OperationKind operation_;
};

}  // namespace

std::unique_ptr<host::SyncReporter> makeJsonReporter(StandardOutput& output, host::OperationKind operation) {
  return std::make_unique<JsonReporter>(output, operation);
}

}  // namespace appsync::cli
