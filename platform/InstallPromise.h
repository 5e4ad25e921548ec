// Deliveries that clients of the install-coordination service promise.
#pragma once

#include <cstdint>
#include <optional>
#include <string>

#include "base/Error.h"
#include "platform/ClientIdentity.h"
#include "platform/FileLocation.h"

namespace appsync::platform {

/// A delivery that an install waits for. Created by `InstallCoordination` and attached to one coordinator or
/// placeholder. Ownership is shared between the client and the service; either may release its share at any time.
///
/// Thread-safe. Setters have no effect once the promise is cancelled or the coordinator or placeholder that it is
/// attached to has ended.
class InstallPromise {
 public:
  virtual ~InstallPromise() = default;

  [[nodiscard]] virtual std::string name() const = 0;
  /// The client that created the promise.
  [[nodiscard]] virtual ClientIdentity client() const = 0;
  /// In bytes; 0 if unknown.
  [[nodiscard]] virtual std::uint64_t diskSpaceNeeded() const = 0;

  /// The fraction delivered, from 0 to 1, as shown to the user. Values out of range are clamped.
  [[nodiscard]] virtual double percentComplete() const = 0;
  virtual void setPercentComplete(double fraction) = 0;

  /// Whether the promise is fulfilled. A complete promise stays complete; `setComplete(false)` then has no effect.
  [[nodiscard]] virtual bool isComplete() const = 0;
  virtual void setComplete(bool complete) = 0;

  /// Cancels the promise, which then can no longer be fulfilled. Fails if the promise is attached and `client` is not
  /// its creator.
  virtual Status cancelForReason(const Error& reason, ClientIdentity client) = 0;

  /// For logs.
  [[nodiscard]] virtual std::string description() const = 0;
};

/// A promise of a file or directory. The client owns the file until the promise is complete. The service then owns the
/// file of an app asset and deletes it when the install has ended, successfully or not. The client keeps ownership of
/// an icon's file, which the service reads until the placeholder ends.
class PromisedTransferToPath : public InstallPromise {
 public:
  /// The device path, or nullopt if it is not known yet. It must be set before the promise is complete: the install
  /// fails if there is no path by then, or nothing is at the path.
  [[nodiscard]] virtual std::optional<FileLocation> transferPath() const = 0;
  virtual void setTransferPath(const FileLocation& path) = 0;
};

/// A promise that is fulfilled outside the service, which only learns that it is complete.
class PromisedOutOfBandTransfer : public InstallPromise {};

/// Marks the promise as fulfilled, and its progress as complete.
inline void fulfil(InstallPromise& promise) {
  promise.setPercentComplete(1.0);
  promise.setComplete(true);
}

}  // namespace appsync::platform
