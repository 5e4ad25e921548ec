// Backs up and wipes a device, restores the backup to a new one and syncs it.
#pragma once

#include <atomic>
#include <cstddef>
#include <map>
#include <memory>
#include <mutex>
#include <string>
#include <thread>
#include <vector>

#include "tests/faults/DaemonSync.h"

namespace appsync::test {

/// Apps with and without data and licence, demoted in both ways, and one whose store metadata is not a property list.
/// The order of the plug-in's platform calls is the same in every run.
class WholeRestore {
 public:
  /// The apps of a device, "com.a 2.0" or "com.a placeholder 7".
  using Apps = std::vector<std::string>;

  explicit WholeRestore(Mode mode);

  /// Sets a hook for the plug-in's platform calls on both devices. Calls are sequential, on any thread.
  void setHook(CallJournal::Hook hook);

  /// Backs up the device, with the parts of the plug-in and the host.
  void backUp();
  /// Destroys the device that was backed up, after checking that a backup without failures is complete.
  void wipe();
  /// Restores the new device. The host writes its file unless it exists. Checks that the wait was bounded, the file is
  /// in one place and the count of placeholders is balanced.
  void restore();
  /// Syncs packages; in coordinated mode through the store.
  void sync();

  /// Cancels, as the user, installs that have their package and never end: the call that reports an app without data
  /// cannot fail, so its loss is not detected.
  void cancelStalledInstalls();

  [[nodiscard]] FakePlatform& device() { return *device_; }
  [[nodiscard]] Apps apps() const;
  /// The expected state without failures.
  [[nodiscard]] static Apps readableApps();
  /// The numbers of files that were archived and that the host wrote.
  [[nodiscard]] std::size_t archivedFiles() const { return archived_; }
  [[nodiscard]] std::size_t writtenFiles() const { return written_; }

 private:
  void makeNewDevice();
  void prepareForBackup();
  void writeRestoreFile();
  void countRestoreFiles();
  void expectBalance(AppsClient& client);
  void demoteDirectly();
  void deliverFromStore();

  const Mode mode_;
  std::mutex hookMutex_;
  CallJournal::Hook hook_;
  /// Runs calls that are not counted as the plug-in's.
  std::atomic<std::thread::id> mutedThread_;
  std::unique_ptr<FakePlatform> device_;
  /// The backup: the contents of the restore file.
  Bytes backup_;
  std::size_t written_ = 0;
  std::size_t archived_ = 0;
};

}  // namespace appsync::test
