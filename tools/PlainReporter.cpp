#include "tools/ReportLines.h"
#include "tools/SyncReporter.h"

namespace appsync::tools {
namespace {

class PlainReporter final : public SyncReporter {
 public:
  explicit PlainReporter(StandardOutput& output) : output_(output) {}

  void progressed(const AppProgress& /*progress*/) override {}

  void waits(const AppName& app, std::string_view reason) override { write(waitingLine(app, reason)); }

  void interrupted() override { printError(kInterruptedNotice); }

  void finished(const AppOutcome& outcome) override {
    if (outcome.event == AppEvent::failed) {
      printError(failureSentence(outcome));
    } else if (const std::string line = outcomeLine(outcome); !line.empty()) {
      write(line);
    }
  }

  void summarise(const AppOutcomes& outcomes) override { write(summaryLine(outcomes)); }

 private:
  void write(const std::string& line) {
    output_.writeLine(line);
    output_.flush();
  }

  StandardOutput& output_;
};

}  // namespace

std::unique_ptr<SyncReporter> makePlainReporter(StandardOutput& output) {
  return std::make_unique<PlainReporter>(output);
}

}  // namespace appsync::tools
