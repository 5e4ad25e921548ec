#include "kit/fakes/FakeHomeScreen.h"

#include <utility>

#include "kit/fakes/CallJournal.h"
#include "plist/PropertyList.h"

namespace appsync::test {

using platform::TerminationAssertionOutcome;

namespace {

constexpr platform::HomeScreenService::Port kPort = 0x5056;

/// A code that no home screen documents.
constexpr TerminationAssertionOutcome kInjectedFailure{255};

void checkPort(platform::HomeScreenService::Port port) {
  if (port != kPort) misuse("the home screen has no such port");
}

}  // namespace

class FakeHomeScreen::Assertion final : public platform::TerminationAssertion {
 public:
  Assertion(FakeHomeScreen& screen, std::string identifier) : screen_(screen), identifier_(std::move(identifier)) {}
  ~Assertion() override { screen_.release(identifier_); }
  Assertion(const Assertion&) = delete;
  Assertion& operator=(const Assertion&) = delete;

 private:
  FakeHomeScreen& screen_;
  const std::string identifier_;
};

FakeHomeScreen::~FakeHomeScreen() {
  if (!held_.empty()) misuse("the home screen is destroyed while an assertion is held on " + *held_.begin());
}

std::vector<std::string> FakeHomeScreen::iconStates() const {
  const std::scoped_lock lock(mutex_);
  return iconStates_;
}

void FakeHomeScreen::setFlattenedIconState(const std::vector<std::string>& identifiers) {
  setFlattenedIconState(plist::writeBinary(plist::Array(identifiers.begin(), identifiers.end())).value());
}

void FakeHomeScreen::setFlattenedIconState(std::optional<Bytes> bytes) {
  const std::scoped_lock lock(mutex_);
  flattened_ = std::move(bytes);
}

void FakeHomeScreen::answerNext(std::string_view identifier, std::initializer_list<AssertionAnswer> answers) {
  const std::scoped_lock lock(mutex_);
  std::deque<AssertionAnswer>& queue = nextAnswers_[std::string(identifier)];
  queue.insert(queue.end(), answers);
}

void FakeHomeScreen::answerAlways(std::string_view identifier, AssertionAnswer answer) {
  const std::scoped_lock lock(mutex_);
  answers_[std::string(identifier)] = answer;
}

std::multiset<std::string> FakeHomeScreen::held() const {
  const std::scoped_lock lock(mutex_);
  return held_;
}

platform::HomeScreenService::Port FakeHomeScreen::blockableServerPort() {
  static_cast<void>(journal_.beforeCall("homeScreen.blockableServerPort"));
  return kPort;
}

void FakeHomeScreen::setIconState(Port port, ByteView layout) {
  checkPort(port);
  if (journal_.beforeCall("homeScreen.setIconState")) return;
  const std::scoped_lock lock(mutex_);
  iconStates_.emplace_back(textOf(layout));
}

std::optional<Bytes> FakeHomeScreen::getFlattenedIconState(Port port, std::uint32_t format) {
  checkPort(port);
  if (format != 1) misuse("the home screen supports format 1 only");
  if (journal_.beforeCall("homeScreen.getFlattenedIconState")) return std::nullopt;
  const std::scoped_lock lock(mutex_);
  return flattened_;
}

std::unique_ptr<platform::TerminationAssertion> FakeHomeScreen::terminationAssertionCreate(
    std::string_view bundleIdentifier, std::uint32_t reason, TerminationAssertionOutcome& outcome) {
  if (reason != 0) misuse("the reason for an assertion is always 0");
  if (journal_.beforeCall("homeScreen.terminationAssertionCreate", bundleIdentifier)) {
    outcome = kInjectedFailure;
    return nullptr;
  }
  const std::scoped_lock lock(mutex_);
  const AssertionAnswer answer = takeAnswer(bundleIdentifier);
  outcome = answer.outcome;
  if (answer.object == AssertionAnswer::Object::none) return nullptr;
  held_.emplace(bundleIdentifier);
  return std::make_unique<Assertion>(*this, std::string(bundleIdentifier));
}

AssertionAnswer FakeHomeScreen::takeAnswer(std::string_view identifier) {
  const auto next = nextAnswers_.find(identifier);
  if (next != nextAnswers_.end() && !next->second.empty()) {
    const AssertionAnswer answer = next->second.front();
    next->second.pop_front();
    return answer;
  }
  const auto usual = answers_.find(identifier);
  return usual == answers_.end() ? AssertionAnswer() : usual->second;
}

void FakeHomeScreen::release(const std::string& identifier) {
  journal_.note("homeScreen.release " + identifier);
  const std::scoped_lock lock(mutex_);
  held_.erase(held_.find(identifier));
}

}  // namespace appsync::test
