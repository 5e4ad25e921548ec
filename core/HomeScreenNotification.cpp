// What the home screen hears of a sync, and the order of its icons.
#include "core/AppsClient.h"
#include "platform/SyncFiles.h"

namespace appsync {

namespace {

constexpr std::string_view kSyncNotification = "com.corvel.solvary.zeph.wsyncnotify";

/// The one format in which home screens give their icon state.
constexpr std::uint32_t kFlattenedIconStateFormat = 1;

}  // namespace

void AppsClient::_notifySolvary(platform::Platform& platform, bool starting) {
  const PlugInLog log(platform.syncFramework());
  platform::SystemNotify& notify = platform.systemNotify();
  const auto registration = notify.registerCheck(kSyncNotification);
  log.message("%s|Notifying SV we are %s syncing", starting ? "starting" : "done");
  static_cast<void>(platform.homeScreen().blockableServerPort());  // Looking it up starts the home screen's server.
  if (registration.status != 0) {
    log.error("%s|Uh Oh...can't send notification to SV:%d", static_cast<int>(registration.status));
    return;
  }
  notify.setState(registration.token, starting ? 1 : 0);
  notify.post(kSyncNotification);
}

plist::Array AppsClient::_savedIconOrder(platform::Platform& platform) {
  const PlugInLog log(platform.syncFramework());
  platform::HomeScreenService& homeScreen = platform.homeScreen();
  const auto iconState = homeScreen.getFlattenedIconState(homeScreen.blockableServerPort(), kFlattenedIconStateFormat);
  if (!iconState || iconState->empty()) {
    log.message("%s|got no icon sort order from SV");
    return {};
  }
  log.message("%s|saved icon sort order");
  platform.fileSystem().writeFileAtomically(kAssetSortOrderPath, *iconState).ignore();
  auto order = plist::read(*iconState);
  plist::Array* identifiers = order ? order->array() : nullptr;
  return identifiers == nullptr ? plist::Array{} : std::move(*identifiers);
}

}  // namespace appsync
