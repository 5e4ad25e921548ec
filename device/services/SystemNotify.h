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

/// Since one process at a time holds a device, posting reaches the observers of this process. States are kept in the
/// device's database: they outlive the process, and readers of the device see them.
///
/// Observers are called on one thread, one at a time, in the order of the posts. Posts that are still on their way when
/// the service is destroyed are dropped.
class SystemNotify final : public platform::SystemNotify {
 public:
  /// The status of a registration for an empty name.
  static constexpr std::uint32_t kInvalidName = 1;

  static constexpr const char* kSchema =
      "create table if not exists notification_states (name text primary key, state integer not null) without rowid;";

  /// `database` must outlive the service.
  explicit SystemNotify(Database& database) : database_(database) {}

  /// Adding the same observer, callback, name and filter again changes nothing. Posts have no sender: an observer that
  /// asks for one sender's posts hears none.
  void addObserver(void* observer, Callback callback, std::string_view name, const void* object,
                   platform::SuspensionBehavior suspension) override;
  void removeObserver(void* observer, std::string_view name) override;

  /// Every registration of one name gets the same token.
  [[nodiscard]] Registration registerCheck(std::string_view name) override;
  /// An unknown token changes nothing.
  void setState(Token token, std::uint64_t state) override;
  void post(std::string_view name) override;

  /// The state of a name; absent when it was never set.
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
  /// Addresses are the receivers that `callbacks_` knows.
  std::vector<std::shared_ptr<const Observation>> observations_;
  std::vector<std::string> tokens_;  ///< the name of token n is element n - 1
  std::map<std::string, Token, std::less<>> tokensByName_;
  CallbackThread callbacks_;
};

}  // namespace appsync::device
