#include "device/DeviceError.h"

#include <algorithm>
#include <array>
#include <cerrno>
#include <memory>
#include <utility>

#include "device/storage/Database.h"

namespace appsync::device {

namespace {

struct Meaning {
  int error;
  DeviceFailure failure;
  std::string_view advice;
};

constexpr std::string_view kMakeOne = "there is no such folder; make a device with \"appsync init\"";
constexpr std::string_view kNotOne = "is no folder; name a device's folder, or make one with \"appsync init\"";
constexpr std::string_view kMakeRoom = "the disk is full; make room and try again";
constexpr std::string_view kMayNotWrite = "may not be written; change its permissions, or use a copy";

constexpr std::array<Meaning, 7> kMeanings{{
    {ENOENT, DeviceFailure::missing, kMakeOne},
    {ENOTDIR, DeviceFailure::notADevice, kNotOne},
    {ENOSPC, DeviceFailure::noSpace, kMakeRoom},
    {EDQUOT, DeviceFailure::noSpace, kMakeRoom},
    {EROFS, DeviceFailure::readOnly, kMayNotWrite},
    {EACCES, DeviceFailure::readOnly, kMayNotWrite},
    {EPERM, DeviceFailure::readOnly, kMayNotWrite},
}};

Error causedBy(Error error, const Error& cause) {
  error.underlying = std::make_shared<const Error>(cause);
  return error;
}

}  // namespace

Error deviceError(DeviceFailure failure, std::string text) {
  return {std::string(kDeviceDomain), static_cast<long>(failure), std::move(text), nullptr};
}

Error deviceError(const std::string& path, Access access, const Error& cause) {
  if (cause.domain == kDeviceDomain) return cause;
  if (isDatabaseDamage(cause)) {
    return causedBy(deviceError(DeviceFailure::damaged,
                                path + ": the device is damaged (" + cause.text +
                                    "); put a copy of it in its place, or make a new one with \"appsync init\""),
                    cause);
  }
  const auto found = std::ranges::find(kMeanings, systemErrorOf(cause), &Meaning::error);
  const bool isAnswer =
      found != kMeanings.end() && (found->failure != DeviceFailure::readOnly || access == Access::exclusive);
  if (!isAnswer) {
    return causedBy(deviceError(DeviceFailure::notAccessible,
                                path + ": the device cannot be used (" + cause.text + "); see to that and try again"),
                    cause);
  }
  return causedBy(deviceError(found->failure, path + ": " + std::string(found->advice)), cause);
}

}  // namespace appsync::device
