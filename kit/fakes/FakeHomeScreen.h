// The home screen: icon layouts and termination assertions.
#pragma once

#include <cstddef>
#include <cstdint>
#include <deque>
#include <map>
#include <memory>
#include <mutex>
#include <optional>
#include <set>
#include <string>
#include <string_view>
#include <vector>

#include "kit/fakes/CallJournal.h"
#include "platform/HomeScreenService.h"

namespace appsync::test {

/// The answer to one request for an assertion.
struct AssertionAnswer {
  enum class Object { made, none };

  platform::TerminationAssertionOutcome outcome = platform::TerminationAssertionOutcome::granted;
  Object object = Object::made;

  [[nodiscard]] static AssertionAnswer granted() { return {}; }
  [[nodiscard]] static AssertionAnswer denied() { return without(1); }
  [[nodiscard]] static AssertionAnswer notFound() { return without(2); }
  /// An undocumented code, without an assertion.
  [[nodiscard]] static AssertionAnswer without(std::uint8_t code) {
    return {platform::TerminationAssertionOutcome{code}, Object::none};
  }
};

/// By default grants every assertion. Journal lines: "homeScreen.setIconState" and so on;
/// "homeScreen.terminationAssertionCreate com.a", and "homeScreen.release com.a" when an assertion is destroyed. Fails
/// the test if a port is invalid, `format` is not 1 or `reason` is not 0, or if it is destroyed while an assertion is
/// held.
class FakeHomeScreen final : public platform::HomeScreenService {
 public:
  explicit FakeHomeScreen(CallJournal& journal) : journal_(journal) {}
  ~FakeHomeScreen() override;
  FakeHomeScreen(const FakeHomeScreen&) = delete;
  FakeHomeScreen& operator=(const FakeHomeScreen&) = delete;

  /// The layouts received, in order.
  [[nodiscard]] std::vector<std::string> iconStates() const;

  /// Set the result of `getFlattenedIconState`: these identifiers, these bytes, or nullopt (the default).
  void setFlattenedIconState(const std::vector<std::string>& identifiers);
  void setFlattenedIconState(std::optional<Bytes> bytes);

  /// Answers the app's next requests with these, in order, and later ones by default.
  void answerNext(std::string_view identifier, std::initializer_list<AssertionAnswer> answers);
  void answerAlways(std::string_view identifier, AssertionAnswer answer);

  /// The apps on which assertions are held.
  [[nodiscard]] std::multiset<std::string> held() const;

  [[nodiscard]] Port blockableServerPort() override;
  void setIconState(Port port, ByteView layout) override;
  [[nodiscard]] std::optional<Bytes> getFlattenedIconState(Port port, std::uint32_t format) override;
  [[nodiscard]] std::unique_ptr<platform::TerminationAssertion> terminationAssertionCreate(
      std::string_view bundleIdentifier, std::uint32_t reason, platform::TerminationAssertionOutcome& outcome) override;

 private:
  class Assertion;

  AssertionAnswer takeAnswer(std::string_view identifier);
  void release(const std::string& identifier);

  CallJournal& journal_;
  mutable std::mutex mutex_;
  std::vector<std::string> iconStates_;
  std::optional<Bytes> flattened_;
  std::map<std::string, std::deque<AssertionAnswer>, std::less<>> nextAnswers_;
  std::map<std::string, AssertionAnswer, std::less<>> answers_;
  std::multiset<std::string> held_;
};

}  // namespace appsync::test
