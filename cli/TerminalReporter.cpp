#include <algorithm>
#include <chrono>
#include <cmath>
#include <string>
#include <vector>

#include <sys/ioctl.h>
#include <unistd.h>

#include "cli/Printable.h"
#include "cli/ReportText.h"
#include "cli/Reporters.h"

namespace appsync::cli {
namespace {

using Clock = std::chrono::steady_clock;

constexpr auto kMinimumTimeBetweenDrawings = std::chrono::milliseconds(50);
constexpr std::size_t kMaximumAppLines = 10;

struct Size {
  std::size_t columns = 80;
  std::size_t rows = 24;
};

/// Called at each drawing: the user may resize the terminal.
Size terminalSize() {
  struct winsize found = {};
  if (::ioctl(STDOUT_FILENO, TIOCGWINSZ, &found) != 0 || found.ws_col == 0 || found.ws_row == 0) return {};
  return {found.ws_col, found.ws_row};
}

std::string_view wordFor(host::AppStage stage) {
  switch (stage) {
    case host::AppStage::sending:
      return "sending";
    case host::AppStage::installing:
      return "installing";
    case host::AppStage::waiting:
      break;
  }
  return "waiting";
}

/// "verb       what      [#####-----]  50 %" in at most `columns`; the percentage is kept longest.
std::string progressLine(std::string_view verb, std::string_view what, double fraction, std::size_t columns) {
  constexpr std::size_t kVerb = 11;
  constexpr std::size_t kPercent = 6;
  constexpr std::size_t kMostBar = 30;
  const std::string percent = std::to_string(static_cast<int>(std::floor(fraction * 100)));
  const std::string tail = std::string(kPercent - 2 - percent.size(), ' ') + percent + " %";
  if (columns <= kVerb + kPercent) return tail.substr(0, columns);
  const std::size_t free = columns - kVerb - kPercent;
  const std::size_t bar = free < 24 ? 0 : std::min(kMostBar, free / 2);
  const auto full = static_cast<std::size_t>(fraction * static_cast<double>(bar));
  const std::string drawn = bar < 3 ? "" : "[" + std::string(full, '#') + std::string(bar - full, '-') + "]";
  return fitted(verb, kVerb) + fitted(what, free - drawn.size()) + drawn + tail;
}

class TerminalReporter final : public host::SyncReporter {
 public:
  explicit TerminalReporter(StandardOutput& output) : output_(output) {}
  ~TerminalReporter() override { erase(); }

  void progressed(const host::AppProgress& progress) override {
    lineOf(progress.name).stage = progress.stage;
    lineOf(progress.name).fraction = progress.fraction;
    overall_ = progress.overall;
    finishedApps_ = progress.finishedApps;
    allApps_ = progress.allApps;
    if (const auto now = Clock::now(); now - drawn_ >= kMinimumTimeBetweenDrawings) {
      draw();
      drawn_ = now;
    }
  }

  void waits(const host::AppName& app, std::string_view reason) override { writeAbove(waitingLine(app, reason)); }

  void interrupted() override { printErrorAbove(kInterruptedNotice); }
  void warned(std::string_view sentence) override { printErrorAbove(sentence); }

  void finished(const host::AppOutcome& outcome) override {
    std::erase_if(running_, [&](const Line& line) { return line.identifier == outcome.name.identifier; });
    if (outcome.event == host::AppEvent::failed) {
      printErrorAbove(failureSentence(outcome));
    } else if (const std::string line = outcomeLine(outcome); !line.empty()) {
      writeAbove(line);
    }
  }

  void summarise(const host::AppOutcomes& outcomes) override {
    erase();
    running_.clear();
    allApps_ = 0;
    output_.writeLine(summaryLine(outcomes));
    output_.flush();
  }

 private:
  struct Line {
    std::string identifier;
    std::string name;
    host::AppStage stage = host::AppStage::sending;
    double fraction = 0;
  };

  Line& lineOf(const host::AppName& app) {
    const auto found = std::find_if(running_.begin(), running_.end(),
                                    [&](const Line& line) { return line.identifier == app.identifier; });
    if (found != running_.end()) return *found;
    return running_.emplace_back(Line{app.identifier, shownName(app), host::AppStage::sending, 0});
  }

  void writeAbove(const std::string& line) {
    erase();
    output_.writeLine(line);
    draw();
  }

  void printErrorAbove(std::string_view sentence) {
    erase();
    printError(sentence);
    draw();
  }

  /// Moves the cursor to the start of the drawing and clears the terminal below.
  void erase() {
    if (drawnLines_ == 0) return;
    output_.write("\r\x1b[" + std::to_string(drawnLines_) + "A\x1b[J");
    output_.flush();
    drawnLines_ = 0;
  }

  void draw() {
    erase();
    if (allApps_ == 0) return;
    const Size size = terminalSize();
    // The last column stays free: a line that fills it is wrapped by some terminals.
    const std::size_t columns = size.columns - 1;
    const std::size_t most = std::min(kMaximumAppLines, size.rows > 3 ? size.rows - 3 : 0);
    for (const Line& line : running_) {
      if (drawnLines_ == most) break;
      output_.writeLine(progressLine(wordFor(line.stage), line.name, line.fraction, columns));
      ++drawnLines_;
    }
    const std::string count = std::to_string(finishedApps_) + " of " + std::to_string(allApps_) + " apps";
    output_.writeLine(progressLine("total", count, overall_, columns));
    ++drawnLines_;
    output_.flush();
  }

  StandardOutput& output_;
  std::vector<Line> running_;
  double overall_ = 0;
  std::size_t finishedApps_ = 0;
  std::size_t allApps_ = 0;
  std::size_t drawnLines_ = 0;
  Clock::time_point drawn_;
};

}  // namespace

std::unique_ptr<host::SyncReporter> makeTerminalReporter(StandardOutput& output) {
  return std::make_unique<TerminalReporter>(output);
}

}  // namespace appsync::cli
