// What installed apps take on the device.
#include "core/AppsClient.h"
#include "platform/Keys.h"
#include "reporting/UserApps.h"

namespace appsync {

plist::Dictionary AppsClient::installedAssetMetrics() {
  constexpr std::int64_t kPurgeable = 0;  // Nothing of an app can be freed and come back by itself.
  std::int64_t count = 0;
  std::uint64_t bytes = 0;
  visitUserApps(_platform.defaultRegistry(), [&](const platform::AppRecord& app) {
    if (app.applicationType() != platform::kApplicationTypeUser) return;
    bytes += app.staticDiskUsage();
    ++count;
  });
  _log.message("%s|found %ld apps using %lld bytes (%lld purgeable)", count, static_cast<std::int64_t>(bytes),
               kPurgeable);
  return {{platform::kMetricCount, count},
          {platform::kMetricPhysicalSize, bytes},
          {platform::kMetricPurgeableSize, kPurgeable}};
}

}  // namespace appsync
