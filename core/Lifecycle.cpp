// Construction and destruction, and the constant answers to the daemon.
#include "core/AppsClient.h"
#include "platform/SyncFiles.h"

namespace appsync {

namespace {

constexpr std::size_t kMaximumConcurrentInstalls = 10;

bool isAllowed(platform::Platform& platform, platform::RestrictionSetting setting) {
  return platform.sharedConnection().effectiveBoolValueForSetting(setting) != platform::RestrictionValue::no;
}

}  // namespace

std::shared_ptr<AppsClient> AppsClient::create(platform::Platform& platform) {
  auto client = std::make_shared<AppsClient>(Token{}, platform);
  client->init();
  return client;
}

AppsClient::AppsClient(Token, platform::Platform& platform)
    : _platform(platform),
      _log(platform.syncFramework()),
      _backupManager(platform.makeBackupManager()),
      _installGroup(std::make_shared<Group>(platform.clock())),
      _restorePlaceHoldersWaitGroup(platform.clock()),
      _installOperationQueue(kMaximumConcurrentInstalls) {}

void AppsClient::init() {
  _platform.defaultRegistry().addObserver(*this);
  _platform.transactionLog().initializeWithLog(
      _platform.systemLog().createHandle("com.corvel.appinstallation", "zeph.appsync"));
  _useInstallCoordinator = _platform.installCoordination().coordinationIsEnabled();
  _runsInsideDaemon = _platform.bundles().mainBundleIdentifier() == platform::kDaemonBundleIdentifier;
  if (_runsInsideDaemon) {
    _finishedWaitingForPlaceHolderInstalls = true;
    _platform.systemNotify().addObserver(this, &_handleZEPHStartupCompletedNotification,
                                         platform::kZTStartupCompleteNotification, nullptr,
                                         platform::SuspensionBehavior::drop);
  }
}

AppsClient::~AppsClient() {
  // Callbacks may run until the observers below are removed.
  if (const std::lock_guard lock(_outstandingMutex); !_outstandingDCXTransfers.empty()) {
    _log.error("%s|%{public}@ getting dealloc'd with %lu outstanding DCX transfers!", *this,
               _outstandingDCXTransfers.size());
  }
  const IdentifierSet awaited = _restoreQueue.sync([this] { return _placeholdersForRestoringApps; });
  if (!awaited.empty()) {
    _log.error("%s|%{public}@ getting dealloc'd with %{public}@pending placeholder install complete notifications",
               *this, awaited);
  }
  _platform.defaultRegistry().removeObserver(*this);
  if (_runsInsideDaemon) {  // As read at start-up, even if the main bundle's identifier has changed.
    _platform.systemNotify().removeObserver(this, platform::kZTStartupCompleteNotification);
    _appInstallObserver.reset();
  }
}

void _handleZEPHStartupCompletedNotification(void* context, std::string_view, const void*) {
  if (context == nullptr) return;
  static_cast<AppsClient*>(context)->setupInstallCoordinatorObserver();
}

std::vector<std::string> AppsClient::supportedDataclasses() {
  return {std::string(kApplicationDataclass)};
}

std::string AppsClient::currentSyncAnchor() {
  return "NO_APP_SYNC_ANCHOR";
}

bool AppsClient::prepareForSyncWithHostAnchor(std::string_view, const platform::ProgressCallback&, ErrorSlot) {
  _klpAppsToIgnore.clear();
  return true;
}

bool AppsClient::_appInstallationAllowed() {
  return isAllowed(_platform, platform::RestrictionSetting::appInstallationAllowed);
}

bool AppsClient::_appRemovalAllowed() {
  return isAllowed(_platform, platform::RestrictionSetting::appRemovalAllowed);
}

std::int32_t AppsClient::_getAndResetNumAppInstallsAttempted() {
  return static_cast<std::int32_t>(_numAppInstallsAttempted.exchange(0, std::memory_order_relaxed));
}

}  // namespace appsync
