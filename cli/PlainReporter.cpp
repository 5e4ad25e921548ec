#include "cli/ReportText.h"
#include "cli/Reporters.h"

namespace appsync::cli {
namespace {

class PlainReporter final : public host::SyncReporter {
 public:
  explicit PlainReporter(StandardOutput& output) : output_(output) {}

  void progressed(const host::AppProgress& /*progress*/) override {}

  void waits(const host::AppName& app, std::string_view reason) override { write(waitingLine(app, reason)); }

  void interrupted() override { printError(kInterruptedNotice); }
  void warned(std::string_view sentence) override { printError(sentence); }

  void finished(const host::AppOutcome& outcome) override {
    if (outcome.event == host::AppEvent::failed) {
      printError(failureSentence(outcome));
    } else if (const std::string line = outcomeLine(outcome); !line.empty()) {
      write(line);
    }
  }

  void summarise(const host::AppOutcomes& outcomes) override { write(summaryLine(outcomes)); }

 private:
  void write(const std::string& line) {
    output_.writeLine(line);
    output_.flush();
  }

  StandardOutput& output_;
};

}  // namespace

std::unique_ptr<host::SyncReporter> makePlainReporter(StandardOutput& output) {
  return std::make_unique<PlainReporter>(output);
}

}  // namespace appsync::cli
