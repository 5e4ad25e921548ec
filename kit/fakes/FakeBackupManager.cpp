#include "kit/fakes/FakeBackupManager.h"

#include "kit/fakes/CallJournal.h"
#include "kit/fakes/Patience.h"

namespace appsync::test {

class FakeBackups::Connection final : public platform::BackupManager {
 public:
  explicit Connection(FakeBackups& service) : service_(service) {
    const std::scoped_lock lock(service_.mutex_);
    ++service_.connections_;
  }
  ~Connection() override {
    const std::scoped_lock lock(service_.mutex_);
    if (--service_.connections_ == 0) service_.released_.notify_all();
  }
  Connection(const Connection&) = delete;
  Connection& operator=(const Connection&) = delete;

  [[nodiscard]] bool restoreDataExists(std::string_view bundleIdentifier, std::uint64_t* size) override {
    if (service_.journal_.beforeCall("backupManager.restoreDataExists", bundleIdentifier)) return false;
    const std::scoped_lock lock(service_.mutex_);
    const auto found = service_.sizes_.find(bundleIdentifier);
    if (found == service_.sizes_.end()) return false;
    if (size != nullptr) *size = found->second;
    return true;
  }

  bool cancelApplicationRestore(std::string_view bundleIdentifier, ErrorSlot error) override {
    constexpr auto kOperation = BackupOperation::cancelApplicationRestore;
    std::optional<Error> failure =
        service_.journal_.beforeCall("backupManager.cancelApplicationRestore", bundleIdentifier);
    if (!failure) failure = service_.failures.take(kOperation, bundleIdentifier);
    if (failure) {
      setError(error, *std::move(failure));
      return false;
    }
    const std::scoped_lock lock(service_.mutex_);
    service_.sizes_.erase(std::string(bundleIdentifier));
    return true;
  }

 private:
  FakeBackups& service_;
};

FakeBackups::~FakeBackups() {
  if (connections_ != 0) misuse("the backup service is destroyed while a connection is open");
}

void FakeBackups::addRestoreData(std::string_view identifier, std::uint64_t size) {
  const std::scoped_lock lock(mutex_);
  sizes_[std::string(identifier)] = size;
}

bool FakeBackups::hasRestoreData(std::string_view identifier) const {
  const std::scoped_lock lock(mutex_);
  return sizes_.contains(identifier);
}

std::unique_ptr<platform::BackupManager> FakeBackups::connect() {
  static_cast<void>(journal_.beforeCall("backupManager.make"));
  return std::make_unique<Connection>(*this);
}

void FakeBackups::waitUntilReleased() {
  std::unique_lock lock(mutex_);
  const auto isReleased = [this] { return connections_ == 0; };
  if (!released_.wait_for(lock, kPatience, isReleased)) misuse("a connection to the backup service stays open");
}

std::size_t FakeBackups::connections() const {
  const std::scoped_lock lock(mutex_);
  return connections_;
}

}  // namespace appsync::test
