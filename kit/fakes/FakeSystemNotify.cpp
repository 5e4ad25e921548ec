#include "kit/fakes/FakeSystemNotify.h"

#include <algorithm>
#include <utility>

#include "kit/fakes/CallJournal.h"

namespace appsync::test {

namespace {

constexpr std::uint32_t kInjectedFailure = 1;

std::uint64_t stateIn(const std::map<std::string, std::uint64_t, std::less<>>& states, std::string_view name) {
  const auto found = states.find(name);
  return found == states.end() ? 0 : found->second;
}

}  // namespace

std::ostream& operator<<(std::ostream& out, const Post& post) {
  return out << post.name << " = " << post.state;
}

FakeSystemNotify::~FakeSystemNotify() {
  if (!observations_.empty())
    misuse("the notification service is destroyed while an observer is registered: " + observations_.front().name);
}

void FakeSystemNotify::failRegistrationsWith(std::uint32_t status) {
  const std::scoped_lock lock(mutex_);
  registrationStatus_ = status;
}

std::vector<Post> FakeSystemNotify::posts() const {
  const std::scoped_lock lock(mutex_);
  return posts_;
}

std::uint64_t FakeSystemNotify::state(std::string_view name) const {
  const std::scoped_lock lock(mutex_);
  return stateIn(states_, name);
}

std::size_t FakeSystemNotify::observerCount(std::string_view name) const {
  const std::scoped_lock lock(mutex_);
  return static_cast<std::size_t>(std::ranges::count(observations_, name, &Observation::name));
}

void FakeSystemNotify::deliver(std::string_view name, const void* sender) {
  notifyObservers(name, sender);
  thread_.waitUntilIdle();
}

void FakeSystemNotify::notifyObservers(std::string_view name, const void* sender) {
  const std::scoped_lock lock(mutex_);
  for (const Observation& observation : observations_) {
    if (observation.name != name || (observation.object != nullptr && observation.object != sender)) continue;
    thread_.post(observation.subscription,
                 [observation, sender] { observation.callback(observation.observer, observation.name, sender); });
  }
}

void FakeSystemNotify::addObserver(void* observer, Callback callback, std::string_view name, const void* object,
                                   platform::SuspensionBehavior) {
  static_cast<void>(journal_.beforeCall("systemNotify.addObserver", name));
  if (callback == nullptr) return misuse("an observer is registered without a callback");
  const std::scoped_lock lock(mutex_);
  observations_.push_back({observer, callback, std::string(name), object, thread_.subscribe()});
}

void FakeSystemNotify::removeObserver(void* observer, std::string_view name) {
  static_cast<void>(journal_.beforeCall("systemNotify.removeObserver", name));
  std::vector<FakeCallbackThread::Subscription> ended;
  {
    const std::scoped_lock lock(mutex_);
    std::erase_if(observations_, [&](const Observation& observation) {
      const bool matches = observation.observer == observer && observation.name == name;
      if (matches) ended.push_back(observation.subscription);
      return matches;
    });
  }
  for (const FakeCallbackThread::Subscription subscription : ended)
    thread_.unsubscribe(subscription);
}

platform::SystemNotify::Registration FakeSystemNotify::registerCheck(std::string_view name) {
  if (journal_.beforeCall("systemNotify.registerCheck", name)) return {kInjectedFailure, 0};
  const std::scoped_lock lock(mutex_);
  if (registrationStatus_ != 0) return {registrationStatus_, 0};
  tokens_.emplace_back(name);
  return {0, static_cast<Token>(tokens_.size() - 1)};
}

void FakeSystemNotify::setState(Token token, std::uint64_t state) {
  std::string name;
  {
    const std::scoped_lock lock(mutex_);
    if (token < 0 || static_cast<std::size_t>(token) >= tokens_.size()) return misuse("a state is set without a token");
    name = tokens_[static_cast<std::size_t>(token)];
  }
  if (journal_.beforeCall("systemNotify.setState", name + " " + std::to_string(state))) return;
  const std::scoped_lock lock(mutex_);
  states_[name] = state;
}

void FakeSystemNotify::post(std::string_view name) {
  if (journal_.beforeCall("systemNotify.post", name)) return;
  {
    const std::scoped_lock lock(mutex_);
    posts_.push_back({std::string(name), stateIn(states_, name)});
  }
  notifyObservers(name, nullptr);
}

}  // namespace appsync::test
