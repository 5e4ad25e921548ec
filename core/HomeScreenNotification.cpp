// The home screen's notification of a sync, and the order of its icons.
#include "core/AppsClient.h"
#include "platform/SyncFiles.h"

namespace appsync {

namespace {

constexpr std::string_view kSyncNotification = "com.corvel.solvary.zeph.wsyncnotify";

/// The one format in which home screens give their icon state.
constexpr std::uint32_t kFlattenedIconStateFormat = 1;

/// Returns the home screen's icon order after saving it; empty if the home screen has none.
plist::Array savedIconOrder(platform::Platform& platform, const PlugInLog& log) {
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

std::vector<std::string> AppsClient::_prioritized(platform::Platform& platform, IdentifierSet identifiers) {
  const PlugInLog log(platform.syncFramework());
  std::vector<std::string> prioritized;
  prioritized.reserve(identifiers.size());
  for (const plist::Value& identifier : savedIconOrder(platform, log)) {
    const auto text = identifier.string();
    const auto found = text ? identifiers.find(*text) : identifiers.end();
    if (found == identifiers.end()) continue;
    log.message("%s|prioritize %{public}@", identifier);
    prioritized.push_back(std::move(identifiers.extract(found).value()));
  }
  for (const std::string& identifier : identifiers)
    log.message("%s|lastly %{public}@", identifier);
  return prioritized;
}

}  // namespace appsync
