#include <vector>

#include "cli/Json.h"
#include "cli/Reporters.h"

namespace appsync::cli {
namespace {

/// The ends that an app can come to.
std::vector<host::AppEvent> endsOf(host::Course course) {
  if (course == host::Course::restore)
    return {host::AppEvent::restored, host::AppEvent::failed, host::AppEvent::skipped};
  return {host::AppEvent::installed, host::AppEvent::updated, host::AppEvent::removed, host::AppEvent::failed,
          host::AppEvent::skipped};
}

/// `{"event":"progress","identifier":…,"fraction":…}` and the like, each line complete and handed on at once.
class JsonReporter final : public host::SyncReporter {
 public:
  JsonReporter(StandardOutput& output, host::Course course) : output_(output), course_(course) {}

  void progressed(const host::AppProgress& progress) override {
    write({{"event", "progress"}, {"identifier", progress.app.identifier}, {"fraction", progress.fraction}});
  }

  void waits(const host::AppName& app, std::string_view reason) override {
    write({{"event", "waiting"}, {"identifier", app.identifier}, {"reason", std::string(reason)}});
  }

  void interrupted() override { printError(kInterruptedNotice); }
  void warned(std::string_view sentence) override { printError(sentence); }

  void finished(const host::AppOutcome& outcome) override {
    Json line = {{"event", std::string(host::wordFor(outcome.event))}, {"identifier", outcome.app.identifier}};
    if (!outcome.app.name.empty()) line["name"] = outcome.app.name;
    if (!outcome.app.version.empty()) line["version"] = outcome.app.version;
    if (!outcome.reason.empty()) line["reason"] = outcome.reason;
    write(line);
  }

  void summarise(const host::AppOutcomes& outcomes) override {
    Json line = {{"event", "summary"}};
    for (const host::AppEvent event : endsOf(course_))
      line[std::string(host::wordFor(event))] = Json::array();
    for (const host::AppOutcome& outcome : outcomes) {
      line[std::string(host::wordFor(outcome.event))].push_back(outcome.app.identifier);
    }
    write(line);
  }

 private:
  void write(const Json& line) {
    output_.writeLine(onOneLine(line));
    output_.flush();
  }

  StandardOutput& output_;
  const host::Course course_;
};

}  // namespace

std::unique_ptr<host::SyncReporter> makeJsonReporter(StandardOutput& output, host::Course course) {
  return std::make_unique<JsonReporter>(output, course);
}

}  // namespace appsync::cli
