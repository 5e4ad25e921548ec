// Whether a restored app was demoted before the backup.
#pragma once

#include <cstdint>

namespace appsync {

/// A demoted app had its icon and its data on the device, but no package. The values are those that messages show.
enum class DemotionStatus : std::uint64_t {
  notDemoted = 0,
  intentionallyDemoted = 1,
  automaticallyDemoted = 2,
};

}  // namespace appsync
