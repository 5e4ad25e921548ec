#include "device/coordination/StoreClient.h"

#include <cerrno>
#include <set>
#include <utility>

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include "base/ReturnIfError.h"
#include "device/storage/FileTree.h"
#include "device/storage/SystemCalls.h"

namespace appsync::device {

using platform::ClientIdentity;
using platform::PromisedTransferToPath;

namespace {

constexpr std::size_t kBlockSize = std::size_t{1} << 20;

std::shared_ptr<platform::InstallCoordinator> coordinatorOf(InstallCoordination& service,
                                                            const CoordinatorSummary& app) {
  return service.coordinatorForApp(app.kind, app.identifier, ClientIdentity::CXClientBazaarly,
                                   platform::IfMissing::findNothing, nullptr, nullptr);
}

/// Returns whether a coordinator waits for a package of the store.
bool reliesOnStore(platform::InstallCoordinator& coordinator) {
  if (coordinator.appAssetPromiseResponsibleClient(nullptr) != ClientIdentity::CXClientBazaarly) return false;
  const auto promise = coordinator.appAssetPromise();
  return promise == nullptr || !promise->isComplete();
}

std::string fileNameOf(std::string_view identifier) {
  return std::string(identifier) + ".zip";
}

Error stopped() {
  return {std::string(domains::kPOSIX), ECANCELED, "the store was stopped", nullptr};
}

/// Returns the promise of an earlier store client, or a new one.
Result<std::shared_ptr<PromisedTransferToPath>> promiseFor(InstallCoordination& service,
                                                           platform::InstallCoordinator& coordinator,
                                                           const std::string& identifier) {
  if (auto promise = coordinator.appAssetPromise()) return promise;
  auto promise =
      service.makePromisedTransferToPath(identifier + "-Asset", ClientIdentity::CXClientBazaarly, std::nullopt, 0);
  if (promise == nullptr) return Error::fromErrno(ENOTSUP, "the promise of the package");
  RETURN_IF_ERROR(coordinator.setAppAssetPromise(promise));
  return promise;
}

/// Copies the block at `offset`. Sets `bytes` to its size, 0 at the end. Returns 0 or an errno value.
int copyPiece(int from, int to, std::uint64_t offset, Bytes& buffer, std::size_t& bytes) {
  ssize_t count = -1;
  do {
    count = ::pread(from, buffer.data(), buffer.size(), static_cast<off_t>(offset));
  } while (count < 0 && errno == EINTR);
  if (count < 0) return errno;
  bytes = static_cast<std::size_t>(count);
  return bytes == 0 ? 0 : sys::writeAt(to, ByteView(buffer).first(bytes), static_cast<std::int64_t>(offset));
}

}  // namespace

StoreClient::StoreClient(InstallCoordination& service, DeviceFileSystem& files, FindPackage find, Report report)
    : service_(service), files_(files), find_(std::move(find)), report_(std::move(report)), thread_([this] {
        run();
      }) {}

StoreClient::~StoreClient() {
  isStopping_ = true;
  wait();
}

void StoreClient::wait() {
  if (thread_.joinable()) thread_.join();
}

Result<std::vector<CoordinatorSummary>> StoreClient::awaited(InstallCoordination& service) {
  Result<std::vector<CoordinatorSummary>> all = service.list();
  if (!all) return all;
  std::erase_if(*all, [&](const CoordinatorSummary& app) {
    const auto coordinator = coordinatorOf(service, app);
    return coordinator == nullptr || !reliesOnStore(*coordinator);
  });
  return all;
}

void StoreClient::run() {
  const auto apps = awaited(service_);
  if (!apps) return;
  sweep(*apps);
  for (const CoordinatorSummary& app : *apps) {
    if (isStopping_) return;
    deliver(app);
  }
}

void StoreClient::sweep(const std::vector<CoordinatorSummary>& awaited) {
  const auto all = service_.list();
  const Result<FileDescriptor> folder = files_.root().open(kPackagesPath, O_RDONLY | O_DIRECTORY);
  if (!all || !folder) return;
  std::set<std::string> delivered;
  for (const CoordinatorSummary& app : *all)
    delivered.insert(fileNameOf(app.identifier));
  for (const CoordinatorSummary& app : awaited)
    delivered.erase(fileNameOf(app.identifier));
  std::vector<std::string> strays;
  FolderEntries entries(folder->get());
  while (const char* name = entries.next()) {
    if (!delivered.contains(name)) strays.emplace_back(name);
  }
  for (const std::string& stray : strays)
    static_cast<void>(tree::remove(folder->get(), stray.c_str(), files_.work()));
}

void StoreClient::deliver(const CoordinatorSummary& app) {
  StoreDelivery delivery{app.identifier, app.name, {}, 0, {}};
  const auto coordinator = coordinatorOf(service_, app);
  if (coordinator == nullptr) return;  // It was cancelled meanwhile.
  const Result<std::string> package = find_(app.identifier);
  const auto promise = package ? promiseFor(service_, *coordinator, app.identifier)
                               : Result<std::shared_ptr<PromisedTransferToPath>>(package.error());
  const Status copied = promise ? copy(*package, delivery, **promise) : Status(promise.error());
  delivery.failure = copied.failure();
  report_(delivery);
  if (!copied) return;
  (*promise)->setTransferPath({delivery.path, false});
  (*promise)->setComplete(true);
  // A promise that was withdrawn meanwhile does not own the package.
  if (!(*promise)->isComplete()) files_.removeItem(delivery.path).ignore();
}

Status StoreClient::copy(const std::string& hostPath, StoreDelivery& delivery, PromisedTransferToPath& promise) {
  const FileDescriptor from(::open(hostPath.c_str(), O_RDONLY | O_CLOEXEC | O_NONBLOCK));
  if (!from.valid()) return Error::fromErrno(errno, hostPath);
  struct stat status {};
  if (fstat(from.get(), &status) != 0) return Error::fromErrno(errno, hostPath);
  const auto size = static_cast<std::uint64_t>(status.st_size);
  RETURN_IF_ERROR(files_.createDirectory(kPackagesPath, platform::IntermediateDirectories::create, {}));
  const std::string name = fileNameOf(delivery.identifier);
  delivery.path = std::string(kPackagesPath) + '/' + name;
  const Result<RootDirectory::Place> place = files_.root().place(delivery.path);
  if (!place) return place.error();
  FileDescriptor to;
  int failed = sys::createFile(place->folder.get(), name.c_str(), sys::kFileMode, to);
  Bytes buffer(kBlockSize);
  std::size_t bytes = 1;
  while (failed == 0 && bytes > 0) {
    promise.setPercentComplete(size == 0 ? 0 : static_cast<double>(delivery.bytes) / static_cast<double>(size));
    failed = isStopping_ ? ECANCELED : copyPiece(from.get(), to.get(), delivery.bytes, buffer, bytes);
    if (failed == 0) delivery.bytes += bytes;
  }
  if (failed == 0) return {};
  static_cast<void>(sys::removeFile(place->folder.get(), name.c_str()));
  return failed == ECANCELED ? Status(stopped()) : Status(Error::fromErrno(failed, hostPath));
}

}  // namespace appsync::device
