// The result of a sync or a restore for each app.
#pragma once

#include <cstdint>
#include <string>
#include <string_view>
#include <vector>

namespace appsync::host {

enum class AppEvent : std::uint8_t {
  installed,
  updated,
  removed,
  restored,  ///< its placeholder is on the device; the next sync sends the package
  failed,
  cutOff,     ///< the sync was interrupted before the app was installed; "failed" in JSON
  skipped,    ///< deliberately left as it is, although it differs from the library
  unchanged,  ///< already up to date; "skipped" in JSON
};

/// The reason for skipping an app that the user of the device cancelled.
inline constexpr std::string_view kCancelledOnDevice = "cancelled on the device";

/// Whether the name identifies an app or a package file; both may have the same text.
enum class NameKind : std::uint8_t { app, packageFile };

/// An app, or a package file whose app is unknown, as it appears in reports. The texts are untrusted input.
struct AppName {
  std::string identifier;  ///< for a package file, the file name
  std::string name;        ///< empty if unknown
  std::string version;     ///< empty if unknown
  NameKind kind = NameKind::app;
};

struct AppOutcome {
  AppEvent event = AppEvent::failed;
  AppName name;
  std::string reason;  ///< empty if the app was successful
};

/// Returns whether the planned work was done.
[[nodiscard]] constexpr bool isSuccess(AppEvent event) {
  return event == AppEvent::installed || event == AppEvent::updated || event == AppEvent::removed ||
         event == AppEvent::restored;
}

/// Returns whether the planned work could not be done.
[[nodiscard]] constexpr bool isFailure(AppEvent event) {
  return event == AppEvent::failed || event == AppEvent::cutOff;
}

/// Returns the word for an event in JSON.
[[nodiscard]] std::string_view wordFor(AppEvent event);

/// Every outcome of a sync, in the order of arrival.
using AppOutcomes = std::vector<AppOutcome>;

}  // namespace appsync::host
