#include "kit/fakes/CallJournal.h"

#include <algorithm>
#include <atomic>
#include <memory>
#include <utility>

#include <gtest/gtest.h>

namespace appsync::test {

void misuse(std::string_view contract) {
  ADD_FAILURE() << "misuse of the platform: " << contract;
}

std::optional<Error> CallJournal::beforeCall(std::string_view operation, std::string_view arguments) {
  Hook hook;
  {
    const std::scoped_lock lock(mutex_);
    std::string& line = lines_.emplace_back(operation);
    if (!arguments.empty()) line.append(" ").append(arguments);
    ++callCount_;
    hook = hook_;
  }
  return hook ? hook(operation, arguments) : std::nullopt;
}

void CallJournal::note(std::string line) {
  const std::scoped_lock lock(mutex_);
  lines_.push_back(std::move(line));
}

std::vector<std::string> CallJournal::lines() const {
  const std::scoped_lock lock(mutex_);
  return lines_;
}

std::vector<std::string> CallJournal::lines(std::initializer_list<std::string_view> prefixes) const {
  std::vector<std::string> chosen = lines();
  std::erase_if(chosen, [&](const std::string& line) {
    return std::ranges::none_of(prefixes, [&](std::string_view prefix) { return line.starts_with(prefix); });
  });
  return chosen;
}

std::size_t CallJournal::count(std::string_view prefix) const {
  return lines({prefix}).size();
}

bool CallJournal::contains(std::string_view line) const {
  const std::scoped_lock lock(mutex_);
  return std::ranges::find(lines_, line) != lines_.end();
}

void CallJournal::clear() {
  const std::scoped_lock lock(mutex_);
  lines_.clear();
}

void CallJournal::setHook(Hook hook) {
  const std::scoped_lock lock(mutex_);
  hook_ = std::move(hook);
}

void CallJournal::failCall(std::size_t number, Error error) {
  auto left = std::make_shared<std::atomic<std::size_t>>(number);
  setHook([left, error = std::move(error)](std::string_view, std::string_view) -> std::optional<Error> {
    if (left->fetch_sub(1) == 1) return error;
    return std::nullopt;
  });
}

std::size_t CallJournal::callCount() const {
  const std::scoped_lock lock(mutex_);
  return callCount_;
}

}  // namespace appsync::test
