// What came of each app in a sync, or a restore.
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
  restored,  ///< its placeholder is there again; the package comes with the next sync
  failed,
  cutOff,     ///< the sync was interrupted before the app was on the device; machines are told "failed"
  skipped,    ///< something would have been to do, and was not done on purpose
  unchanged,  ///< nothing was to do; machines are told "skipped"
};

/// Why an app is skipped that somebody on the device did not want.
inline constexpr std::string_view kCancelledOnDevice = "cancelled on the device";

/// What is named: a file of the library may be called as an app is.
enum class NameKind : std::uint8_t { app, packageFile };

/// An app, or a package that does not say whose it is, as people and machines are told of it. Texts are as they came
/// from outside.
struct AppName {
  std::string identifier;  ///< of a package file its name
  std::string name;        ///< empty when it is not known
  std::string version;     ///< empty when it is not known
  NameKind kind = NameKind::app;
};

struct AppOutcome {
  AppEvent event = AppEvent::failed;
  AppName app;
  std::string reason;  ///< why, of everything but a success
};

/// Whether the app now is as it was to be.
[[nodiscard]] constexpr bool isSuccess(AppEvent event) {
  return event == AppEvent::installed || event == AppEvent::updated || event == AppEvent::removed ||
         event == AppEvent::restored;
}

/// Whether the sync did not do for the app what it was to do.
[[nodiscard]] constexpr bool isFailure(AppEvent event) {
  return event == AppEvent::failed || event == AppEvent::cutOff;
}

/// The word for an event in JSON.
[[nodiscard]] std::string_view wordFor(AppEvent event);

/// Every outcome of a sync, in the order in which they came.
using AppOutcomes = std::vector<AppOutcome>;

}  // namespace appsync::host
