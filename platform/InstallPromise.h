// What a client of the install-coordination service promises to deliver.
#pragma once

#include <cstdint>
#include <optional>
#include <string>

#include "base/Error.h"
#include "platform/ClientIdentity.h"
#include "platform/FileLocation.h"

namespace appsync::platform {

/// Something that an install waits for. Made by `InstallCoordination`, attached to one coordinator or placeholder, and
/// shared by the client that made it and the service: either may let go of it at any time.
///
/// Threads: any. A change after the promise was cancelled, or after what it belongs to has ended, does nothing.
class InstallPromise {
 public:
  virtual ~InstallPromise() = default;

  [[nodiscard]] virtual std::string name() const = 0;
  /// Who made it.
  [[nodiscard]] virtual ClientIdentity client() const = 0;
  /// Bytes; 0 when not known.
  [[nodiscard]] virtual std::uint64_t diskSpaceNeeded() const = 0;

  /// How much has been delivered, from 0 to 1, for people to see. What is out of range counts as the nearer end.
  [[nodiscard]] virtual double percentComplete() const = 0;
  virtual void setPercentComplete(double fraction) = 0;

  /// Fulfilled. There is no way back: a promise once complete stays so.
  [[nodiscard]] virtual bool isComplete() const = 0;
  virtual void setComplete(bool complete) = 0;

  /// Takes the promise back. If it is attached, what it is attached to can no longer be completed by it and `client`
  /// must be the one that made it.
  virtual Status cancelForReason(const Error& reason, ClientIdentity client) = 0;

  /// For logs.
  [[nodiscard]] virtual std::string description() const = 0;
};

/// A promise that is fulfilled by a file or folder. While it is not complete the file is the client's. Once complete
/// the file of an app asset is the service's, which removes it when the install has ended, well or badly; an icon's
/// file is read until its placeholder ends, and stays the client's.
class PromisedTransferToPath : public InstallPromise {
 public:
  /// A device path; none while it is not known. It is needed at the latest when the promise becomes complete: an app
  /// whose package has none then, or one that leads to nothing, fails to install.
  [[nodiscard]] virtual std::optional<FileLocation> transferPath() const = 0;
  virtual void setTransferPath(const FileLocation& path) = 0;
};

/// A promise that somebody fulfils elsewhere: the service only hears that it is complete.
class PromisedOutOfBandTransfer : public InstallPromise {};

}  // namespace appsync::platform
