#include "kit/fakes/FakeAppRegistry.h"

#include <algorithm>

#include "kit/fakes/CallJournal.h"
#include "platform/Keys.h"

namespace appsync::test {

using platform::AppRecords;
using platform::AppRegistryObserver;
using platform::BundleKind;
using platform::TSInstallPhase;
using platform::TSInstallState;

namespace {

/// Returns true if an enumeration of kind `walked` visits a bundle of kind `kind`.
bool meets(BundleKind walked, BundleKind kind) {
  return walked == BundleKind::all || walked == kind;
}

BundleKind kindOf(const FakeApp& app) {
  if (app.kind) return *app.kind;
  if (app.applicationType == platform::kApplicationTypeUser) return BundleKind::user;
  return app.applicationType == platform::kApplicationTypeSystem ? BundleKind::system : BundleKind::all;
}

bool isTrue(const plist::Dictionary& options, std::string_view key) {
  const plist::Value* value = options.find(key);
  return value != nullptr && plist::truth(*value).value_or(false);
}

}  // namespace

FakeAppRegistry::FakeAppRegistry(CallJournal& journal, FakeFileSystem& files, FakeUninstalledAppsList& uninstalledApps)
    : journal_(journal), files_(files), uninstalledApps_(uninstalledApps) {}

FakeAppRegistry::~FakeAppRegistry() {
  if (!observers_.empty()) misuse("the registry is destroyed while an observer is registered");
  reportGate.open();
  for (const auto& progress : attached_)
    progress->detach();
}

void FakeAppRegistry::add(FakeApp app) {
  attach(app.identifier, app.progress);
  const std::scoped_lock lock(mutex_);
  std::string identifier = app.identifier;
  apps_.insert_or_assign(std::move(identifier), std::move(app));
}

void FakeAppRegistry::addBundle(std::string identifier, BundleKind kind) {
  const std::scoped_lock lock(mutex_);
  otherBundles_.push_back({std::move(identifier), kind});
}

std::optional<FakeApp> FakeAppRegistry::app(std::string_view identifier) const {
  const std::scoped_lock lock(mutex_);
  const auto found = apps_.find(identifier);
  if (found == apps_.end()) return std::nullopt;
  return found->second;
}

std::vector<std::string> FakeAppRegistry::identifiers() const {
  const std::scoped_lock lock(mutex_);
  std::vector<std::string> identifiers;
  for (const auto& [identifier, app] : apps_)
    identifiers.push_back(identifier);
  return identifiers;
}

std::vector<FakeAppRegistry::Install> FakeAppRegistry::installs() const {
  const std::scoped_lock lock(mutex_);
  return installs_;
}

std::vector<FakeAppRegistry::Uninstall> FakeAppRegistry::uninstalls() const {
  const std::scoped_lock lock(mutex_);
  return uninstalls_;
}

std::size_t FakeAppRegistry::mostInstallsAtOnce() const {
  const std::scoped_lock lock(mutex_);
  return mostAtOnce_;
}

// Observers.

void FakeAppRegistry::setInstallOrder(std::vector<std::string> prioritized, std::vector<std::string> paused) {
  const std::scoped_lock lock(mutex_);
  prioritized_ = std::move(prioritized);
  paused_ = std::move(paused);
  postToAll(orderReport());
}

void FakeAppRegistry::addObserver(AppRegistryObserver& observer) {
  static_cast<void>(journal_.beforeCall("registry.addObserver"));
  const std::scoped_lock lock(mutex_);
  const auto [entry, isNew] = observers_.try_emplace(&observer, 0);
  if (!isNew) return;
  entry->second = reports_.subscribe();
  post(entry->second, observer, orderReport());
}

void FakeAppRegistry::removeObserver(AppRegistryObserver& observer) {
  static_cast<void>(journal_.beforeCall("registry.removeObserver"));
  Subscription ended = 0;
  {
    const std::scoped_lock lock(mutex_);
    const auto found = observers_.find(&observer);
    if (found == observers_.end()) return;
    ended = found->second;
    observers_.erase(found);
  }
  reports_.unsubscribe(ended);
}

AppRecords FakeAppRegistry::recordsOf(const std::vector<std::string>& identifiers) const {
  AppRecords records;
  for (const std::string& identifier : identifiers) {
    const auto found = apps_.find(identifier);
    if (found != apps_.end()) records.push_back(std::make_shared<FakeAppRecord>(found->second));
  }
  return records;
}

FakeAppRegistry::Report FakeAppRegistry::orderReport() const {
  return [prioritized = recordsOf(prioritized_), paused = recordsOf(paused_)](AppRegistryObserver& observer) {
    observer.applicationInstallsArePrioritized(prioritized, paused);
  };
}

void FakeAppRegistry::post(Subscription subscription, AppRegistryObserver& observer, Report report) {
  reports_.post(subscription, [this, &observer, report = std::move(report)] {
    reportGate.pass();
    report(observer);
  });
}

void FakeAppRegistry::postToAll(const Report& report) {
  for (const auto& [observer, subscription] : observers_)
    post(subscription, *observer, report);
}

// Look-ups.

bool FakeAppRegistry::applicationIsInstalled(std::string_view bundleIdentifier) {
  if (journal_.beforeCall("registry.applicationIsInstalled", bundleIdentifier)) return false;
  const std::scoped_lock lock(mutex_);
  return apps_.contains(bundleIdentifier);
}

std::shared_ptr<const platform::AppRecord> FakeAppRegistry::recordForIdentifier(
    std::string_view bundleIdentifier, platform::PlaceholderLookup placeholders) {
  const std::string arguments =
      std::string(bundleIdentifier) + (placeholders == platform::PlaceholderLookup::on ? " or placeholder" : "");
  if (journal_.beforeCall("registry.recordForIdentifier", arguments)) return nullptr;
  std::optional<FakeApp> found = app(bundleIdentifier);
  if (!found || (placeholders == platform::PlaceholderLookup::off && !found->isInstalled)) return nullptr;
  return std::make_shared<FakeAppRecord>(*std::move(found));
}

void FakeAppRegistry::enumerateBundlesOfType(
    BundleKind kind, const std::function<void(const platform::BundleRecord& bundle, bool& stop)>& visit) {
  const std::string arguments = std::to_string(static_cast<std::uint32_t>(kind));
  if (journal_.beforeCall("registry.enumerateBundlesOfType", arguments)) return;
  std::vector<std::unique_ptr<platform::BundleRecord>> bundles;
  {
    const std::scoped_lock lock(mutex_);
    for (const auto& [identifier, app] : apps_) {
      if (meets(kind, kindOf(app))) bundles.push_back(std::make_unique<FakeAppRecord>(app));
    }
    for (const OtherBundle& other : otherBundles_) {
      if (meets(kind, other.kind)) bundles.push_back(std::make_unique<FakeBundleRecord>(other.identifier));
    }
  }
  bool stop = false;
  for (const auto& bundle : bundles) {
    visit(*bundle, stop);
    if (stop) return;
  }
}

// Installs.

Status FakeAppRegistry::installApplication(const platform::FileLocation& location, const plist::Dictionary& options) {
  Install install{identifierIn(options), location, options};
  if (auto failure = journal_.beforeCall("registry.installApplication", install.identifier + " " + location.path)) {
    return *std::move(failure);
  }
  {
    const std::scoped_lock lock(mutex_);
    installs_.push_back(install);
    mostAtOnce_ = std::max(mostAtOnce_, ++running_);
  }
  installGate.pass();
  Status status = this->install(install.location, install.options);
  const std::scoped_lock lock(mutex_);
  --running_;
  return status;
}

Status FakeAppRegistry::install(const platform::FileLocation& location, const plist::Dictionary& options) {
  const std::string identifier = identifierIn(options);
  if (auto failure = failures.take(RegistryOperation::installApplication, identifier)) return *std::move(failure);
  const Result<FakePackage> package = readPackage(files_, location, options);
  if (!package) return package.error();
  apply(identifier, *package, options);
  return {};
}

void FakeAppRegistry::showPlaceholder(const std::string& identifier, platform::TSInstallType type) {
  apply(identifier, {PackageKind::placeholder, std::nullopt, 0},
        {{platform::kInstallTypeKey, static_cast<std::uint64_t>(type)}});
}

void FakeAppRegistry::apply(const std::string& identifier, const FakePackage& package,
                            const plist::Dictionary& options) {
  std::shared_ptr<FakeInstallProgress> progress;
  {
    const std::scoped_lock lock(mutex_);
    FakeApp& app = apps_.try_emplace(identifier, identifier).first->second;
    applyPackage(app, package, options);
    progress = app.progress;
  }
  attach(identifier, progress);
  if (package.kind == PackageKind::app) uninstalledApps_.remove(identifier);
}

Status FakeAppRegistry::uninstallApplication(std::string_view bundleIdentifier, const plist::Dictionary& options) {
  const bool placeholdersOnly = isTrue(options, platform::kUninstallPlaceholdersOnlyKey);
  const std::string arguments = std::string(bundleIdentifier) + (placeholdersOnly ? " placeholder only" : "");
  if (auto failure = journal_.beforeCall("registry.uninstallApplication", arguments)) return *std::move(failure);
  {
    const std::scoped_lock lock(mutex_);
    uninstalls_.push_back({std::string(bundleIdentifier), options});
  }
  return uninstall(bundleIdentifier, options);
}

void FakeAppRegistry::removePlaceholder(std::string_view identifier) {
  const std::scoped_lock lock(mutex_);
  const auto found = apps_.find(identifier);
  if (found != apps_.end() && found->second.isPlaceholder) dropPlaceholder(found);
}

Status FakeAppRegistry::uninstall(std::string_view identifier, const plist::Dictionary& options) {
  if (auto failure = failures.take(RegistryOperation::uninstallApplication, identifier)) return *std::move(failure);
  const bool placeholdersOnly = isTrue(options, platform::kUninstallPlaceholdersOnlyKey);
  const std::scoped_lock lock(mutex_);
  const auto found = apps_.find(identifier);
  if (found == apps_.end()) return installerError("no such app: " + std::string(identifier));
  const bool isUnderPlaceholder = found->second.isInstalled && found->second.isPlaceholder;
  if (placeholdersOnly || isUnderPlaceholder) {
    dropPlaceholder(found);
    return {};
  }
  if (found->second.progress) found->second.progress->end(TSInstallState::Canceled);
  if (found->second.isInstalled) uninstalledApps_.add(identifier);
  apps_.erase(found);
  return {};
}

void FakeAppRegistry::dropPlaceholder(Apps::iterator entry) {
  FakeApp& app = entry->second;
  if (app.progress && app.isPlaceholder) app.progress->end(TSInstallState::Canceled);
  if (!app.isInstalled) {
    apps_.erase(entry);
    return;
  }
  app.isPlaceholder = false;
  app.progress = nullptr;
}

// Progress.

void FakeAppRegistry::attach(const std::string& identifier, const std::shared_ptr<FakeInstallProgress>& progress) {
  if (progress == nullptr) return;
  {
    const std::scoped_lock lock(mutex_);
    attached_.insert(progress);
  }
  progress->attach({[this, identifier](std::string_view call) {
                      return !journal_.beforeCall("progress." + std::string(call), identifier);
                    },
                    [this, identifier] { reportCancellation(identifier); }});
}

void FakeAppRegistry::reportCancellation(const std::string& identifier) {
  const std::scoped_lock lock(mutex_);
  postToAll([records = recordsOf({identifier})](AppRegistryObserver& observer) {
    observer.applicationInstallsDidCancel(records);
  });
}

std::shared_ptr<platform::InstallProgress> FakeAppRegistry::installProgressForApplication(
    const platform::AppRecord& record, TSInstallPhase phase) {
  const std::string identifier = record.applicationIdentifier();
  const std::string arguments = identifier + " " + std::to_string(static_cast<std::uint64_t>(phase));
  if (journal_.beforeCall("registry.installProgressForApplication", arguments)) return nullptr;
  const std::optional<FakeApp> found = app(identifier);
  return found ? found->progress : nullptr;
}

void FakeAppRegistry::installPhaseFinishedForProgress(platform::InstallProgress& progress) {
  const auto* known = dynamic_cast<FakeInstallProgress*>(&progress);
  if (known == nullptr) return misuse("a progress of another registry");
  if (journal_.beforeCall("registry.installPhaseFinishedForProgress", known->identifier())) return;
  const std::scoped_lock lock(mutex_);
  const auto found = apps_.find(known->identifier());
  if (found == apps_.end() || found->second.progress.get() != known) return;
  if (known->installState() >= TSInstallState::Canceled) {
    found->second.progress->end(known->installState());
    found->second.progress = nullptr;
  } else {
    found->second.progress->enter(TSInstallPhase::Installing);
  }
}

}  // namespace appsync::test
