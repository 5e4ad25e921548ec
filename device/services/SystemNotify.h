// Named notifications.
#pragma once

#include <cstdint>
#include <map>
#include <memory>
#include <mutex>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "device/services/CallbackThread.h"
#include "platform/SystemNotify.h"

namespace appsync::device {

class Database;

/// Posts reach the observers of this process, the only one with exclusive access. States are stored in the device's
/// database, where other processes can read them.
///
/// Observers are called on one thread, one at a time, in the order of the posts. Destruction drops pending posts.
class SystemNotify final : public platform::SystemNotify {
 public:
  /// The status of registering an empty name.
  static constexpr std::uint32_t kInvalidName = 1;

  static constexpr const char* kSchema =
      "create table if not exists notification_states (name text primary key, state integer not null) without rowid;";

  /// `database` must outlive the service.
  explicit SystemNotify(Database& database) : database_(database) {}

  /// Idempotent for equal arguments. Posts have no sender: an observer with a non-null `object` is never called.
  void addObserver(void* observer, Callback callback, std::string_view name, const void* object,
                   platform::SuspensionBehavior suspension) override;
  void removeObserver(void* observer, std::string_view name) override;

  /// Returns the same token for each registration of a name.
  [[nodiscard]] Registration registerCheck(std::string_view name) override;
  /// Ignores unknown tokens.
  void setState(Token token, std::uint64_t state) override;
  void post(std::string_view name) override;

  /// Returns the state of a name, or nullopt if it was never set.
  [[nodiscard]] std::optional<std::uint64_t> state(std::string_view name);

 private:
  struct Observation {
    void* observer;
    Callback callback;
    std::string name;
    const void* object;
    bool operator==(const Observation&) const = default;
  };

  Database& database_;
  std::mutex mutex_;
  /// The addresses of the elements are the receivers for `callbacks_`.
  std::vector<std::shared_ptr<const Observation>> observations_;
  std::vector<std::string> tokens_;  ///< the name of token n is element n - 1
  std::map<std::string, Token, std::less<>> tokensByName_;
  CallbackThread callbacks_;
};

}  // namespace appsync::device
