// Named notifications.
#pragma once

#include <cstddef>
#include <cstdint>
#include <map>
#include <mutex>
#include <ostream>
#include <string>
#include <string_view>
#include <vector>

#include "kit/fakes/CallJournal.h"
#include "kit/fakes/FakeCallbackThread.h"
#include "platform/SystemNotify.h"

namespace appsync::test {

/// One post, with the state of its name at that time.
struct Post {
  std::string name;
  std::uint64_t state = 0;
  bool operator==(const Post&) const = default;
};
std::ostream& operator<<(std::ostream& out, const Post& post);

/// Calls observers on a separate thread. Journal lines: "systemNotify.addObserver name",
/// "systemNotify.registerCheck name", "systemNotify.setState name 1", "systemNotify.post name". Fails the test if it
/// is destroyed while an observer is registered, if a callback is null, or if a token is invalid.
class FakeSystemNotify final : public platform::SystemNotify {
 public:
  explicit FakeSystemNotify(CallJournal& journal) : journal_(journal) {}
  ~FakeSystemNotify() override;
  FakeSystemNotify(const FakeSystemNotify&) = delete;
  FakeSystemNotify& operator=(const FakeSystemNotify&) = delete;

  /// Sets the status of all later registrations; 0 means success.
  void failRegistrationsWith(std::uint32_t status);

  /// Posts by clients, in order.
  [[nodiscard]] std::vector<Post> posts() const;
  [[nodiscard]] std::uint64_t state(std::string_view name) const;
  [[nodiscard]] std::size_t observerCount(std::string_view name) const;

  /// Posts as another process. Blocks until all observers were called.
  void deliver(std::string_view name, const void* sender = nullptr);

  void addObserver(void* observer, Callback callback, std::string_view name, const void* object,
                   platform::SuspensionBehavior suspension) override;
  void removeObserver(void* observer, std::string_view name) override;
  [[nodiscard]] Registration registerCheck(std::string_view name) override;
  void setState(Token token, std::uint64_t state) override;
  void post(std::string_view name) override;

 private:
  struct Observation {
    void* observer;
    Callback callback;
    std::string name;
    const void* object;
    FakeCallbackThread::Subscription subscription;
  };

  void notifyObservers(std::string_view name, const void* sender);

  CallJournal& journal_;
  mutable std::mutex mutex_;
  std::uint32_t registrationStatus_ = 0;
  std::vector<std::string> tokens_;
  std::map<std::string, std::uint64_t, std::less<>> states_;
  std::vector<Post> posts_;
  std::vector<Observation> observations_;
  FakeCallbackThread thread_;
};

}  // namespace appsync::test
