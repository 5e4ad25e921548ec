#include "kit/fakes/RecordingLog.h"

#include <algorithm>
#include <sstream>

#include "kit/fakes/TextDiff.h"

namespace appsync::test {

namespace {

constexpr std::string_view kPrefix = "com.corvel.qor.Zephtra.AppSync|";

std::vector<std::string> messagesOf(const LogLines& lines) {
  std::vector<std::string> messages;
  messages.reserve(lines.size());
  for (const LogLine& line : lines) {
    messages.push_back(line.text.starts_with(kPrefix) ? line.text.substr(kPrefix.size()) : line.text);
  }
  return messages;
}

std::vector<std::string> printed(const LogLines& lines) {
  std::vector<std::string> texts;
  texts.reserve(lines.size());
  for (const LogLine& line : lines)
    texts.push_back((std::ostringstream() << line).str());
  return texts;
}

}  // namespace

class RecordingLog::Category final : public LogCategory {
 public:
  Category(RecordingLog& log, int number) : log_(log), number_(number) {}

  [[nodiscard]] bool isEnabled(LogLevel level) const noexcept override { return log_.isEnabled(number_, level); }
  void write(LogLevel level, std::string_view message) override { log_.write(number_, level, message); }

 private:
  RecordingLog& log_;
  const int number_;
};

std::ostream& operator<<(std::ostream& out, const LogLine& line) {
  return out << '[' << line.category << (line.level == LogLevel::error ? " error] " : "] ") << line.text;
}

LogLine logged(std::string_view text) {
  return loggedIn(8, text);
}

LogLine loggedError(std::string_view text) {
  return {8, LogLevel::error, std::string(kPrefix).append(text)};
}

LogLine loggedIn(int category, std::string_view text) {
  return {category, LogLevel::standard, std::string(kPrefix).append(text)};
}

LogCategory& RecordingLog::category(int number) {
  const std::scoped_lock lock(mutex_);
  std::unique_ptr<LogCategory>& category = categories_[number];
  if (category == nullptr) category = std::make_unique<Category>(*this, number);
  return *category;
}

void RecordingLog::enable(int category, LogLevel level) {
  const std::scoped_lock lock(mutex_);
  disabled_.erase({category, level});
}

void RecordingLog::disable(int category, LogLevel level) {
  const std::scoped_lock lock(mutex_);
  disabled_.insert({category, level});
}

void RecordingLog::disable(int category) {
  for (const LogLevel level : {LogLevel::standard, LogLevel::error})
    disable(category, level);
}

bool RecordingLog::isEnabled(int category, LogLevel level) const {
  const std::scoped_lock lock(mutex_);
  return !disabled_.contains({category, level});
}

void RecordingLog::write(int category, LogLevel level, std::string_view text) {
  const std::scoped_lock lock(mutex_);
  lines_.push_back({category, level, std::string(text)});
}

LogLines RecordingLog::lines() const {
  const std::scoped_lock lock(mutex_);
  return lines_;
}

LogLines RecordingLog::lines(int category) const {
  LogLines chosen = lines();
  std::erase_if(chosen, [&](const LogLine& line) { return line.category != category; });
  return chosen;
}

std::vector<std::string> RecordingLog::messages() const {
  return messagesOf(lines());
}

std::vector<std::string> RecordingLog::messages(int category) const {
  return messagesOf(lines(category));
}

bool RecordingLog::contains(const LogLine& line) const {
  const std::scoped_lock lock(mutex_);
  return std::ranges::find(lines_, line) != lines_.end();
}

void RecordingLog::clear() {
  const std::scoped_lock lock(mutex_);
  lines_.clear();
}

testing::AssertionResult sameLines(const LogLines& expected, const LogLines& actual) {
  if (expected == actual) return testing::AssertionSuccess();
  return sameLines(printed(expected), printed(actual));
}

}  // namespace appsync::test
