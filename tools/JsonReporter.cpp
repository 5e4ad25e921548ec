#include <vector>

#include "tools/Json.h"
#include "tools/SyncReporter.h"

namespace appsync::tools {
namespace {

/// The ends that an app can come to.
std::vector<AppEvent> endsOf(Course course) {
  if (course == Course::restore) return {AppEvent::restored, AppEvent::failed, AppEvent::skipped};
  return {AppEvent::installed, AppEvent::updated, AppEvent::removed, AppEvent::failed, AppEvent::skipped};
}

/// `{"event":"progress","identifier":…,"fraction":…}` and the like, each line complete and handed on at once.
class JsonReporter final : public SyncReporter {
 public:
  JsonReporter(StandardOutput& output, Course course) : output_(output), course_(course) {}

  void progressed(const AppProgress& progress) override {
    write({{"event", "progress"}, {"identifier", progress.app.identifier}, {"fraction", progress.fraction}});
  }

  void waits(const AppName& app, std::string_view reason) override {
    write({{"event", "waiting"}, {"identifier", app.identifier}, {"reason", std::string(reason)}});
  }

  void interrupted() override { printError(kInterruptedNotice); }

  void finished(const AppOutcome& outcome) override {
    Json line = {{"event", std::string(wordFor(outcome.event))}, {"identifier", outcome.app.identifier}};
    if (!outcome.app.name.empty()) line["name"] = outcome.app.name;
    if (!outcome.app.version.empty()) line["version"] = outcome.app.version;
    if (!outcome.reason.empty()) line["reason"] = outcome.reason;
    write(line);
  }

  void summarise(const AppOutcomes& outcomes) override {
    Json line = {{"event", "summary"}};
    for (const AppEvent event : endsOf(course_))
      line[std::string(wordFor(event))] = Json::array();
    for (const AppOutcome& outcome : outcomes) {
      line[std::string(wordFor(outcome.event))].push_back(outcome.app.identifier);
    }
    write(line);
  }

 private:
  void write(const Json& line) {
    output_.writeLine(onOneLine(line));
    output_.flush();
  }

  StandardOutput& output_;
  const Course course_;
};

}  // namespace

std::unique_ptr<SyncReporter> makeJsonReporter(StandardOutput& output, Course course) {
  return std::make_unique<JsonReporter>(output, course);
}

}  // namespace appsync::tools
