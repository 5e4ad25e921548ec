// Contract of platform/SystemNotify.h.
#pragma once

#include <cstdint>
#include <optional>
#include <string_view>

#include "kit/contracts/Contract.h"
#include "platform/SystemNotify.h"

namespace appsync::test {

class SystemNotifySubject {
 public:
  virtual ~SystemNotifySubject() = default;

  [[nodiscard]] virtual platform::SystemNotify& notify() = 0;
  /// Returns the state of a name, or nullopt if not supported.
  [[nodiscard]] virtual std::optional<std::uint64_t> stateOf(std::string_view name) {
    static_cast<void>(name);
    return std::nullopt;
  }
};

class SystemNotifyContract : public Contract<SystemNotifySubject> {};

}  // namespace appsync::test
