// A device that is backed up and wiped, the new one that its backup is restored to, and the syncs that follow.
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

/// Apps with and without data and licence, demoted in either way, and one whose store metadata is no property list. The
/// order of the plug-in's platform calls is the same in every run.
class WholeRestore {
 public:
  /// Which apps a device holds, "com.a 2.0" or "com.a placeholder 7".
  using Apps = std::vector<std::string>;

  explicit WholeRestore(Mode mode);

  /// Hears of each platform call that the plug-in makes from now on, on whichever device: one at a time, on any thread.
  void setHook(CallJournal::Hook hook);

  /// What is the plug-in's of a backup, and the host's.
  void backUp();
  /// Ends the device that was backed up. Before that it shows that a backup undisturbed makes good what one missed.
  void wipe();
  /// In the process that waits for placeholders. The host leaves its file unless it still lies there. When it returns
  /// the wait was in its bound, the file in one place and the count of placeholders balanced.
  void restore();
  /// Brings packages, in a coordinated device through its store.
  void sync();

  /// What the person does about an install that has its package and never ends: that an app has no data to wait for
  /// is said by a call that cannot fail, so nobody learns when it was lost.
  void giveUpWhatHangs();

  [[nodiscard]] FakePlatform& device() { return *device_; }
  [[nodiscard]] Apps apps() const;
  /// The undisturbed end.
  [[nodiscard]] static Apps everyAppButTheUnreadable();
  /// How many host's files were filed away, and how many the host left.
  [[nodiscard]] std::size_t filesFiledAway() const { return filedAway_; }
  [[nodiscard]] std::size_t filesLeft() const { return left_; }

 private:
  void makeNewDevice();
  void prepareForBackup();
  void leaveRestoreFile();
  void noteWhereTheFileIs();
  void expectBalance(AppsClient& client);
  void demoteDirectly();
  void deliverFromStore();

  const Mode mode_;
  std::mutex hookMutex_;
  CallJournal::Hook hook_;
  /// Whose calls are not the plug-in's.
  std::atomic<std::thread::id> mutedThread_;
  std::unique_ptr<FakePlatform> device_;
  /// The host's backup: what the restore file will hold.
  Bytes backup_;
  std::size_t left_ = 0;
  std::size_t filedAway_ = 0;
};

}  // namespace appsync::test
