// The plug-in's way into the sync framework's log.
#pragma once

#include <string_view>
#include <type_traits>

#include "base/Log.h"
#include "platform/SyncFramework.h"

namespace appsync {

/// The bundle that holds the plug-in; every message begins with it.
inline constexpr std::string_view kPlugInBundleIdentifier = "com.corvel.qor.Zephtra.AppSync";

/// Writes messages, whose formats begin "%s|" but for those of `lookupError`, under the plug-in's name. A value: copies
/// write to the same log.
class PlugInLog {
 public:
  template <class... Args>
  using Format = MessageFormat<std::string_view, std::type_identity_t<Args>...>;

  explicit PlugInLog(platform::SyncFramework& framework) : framework_(&framework) {}

  /// The course of work.
  template <class... Args>
  void message(Format<Args...> format, const Args&... args) const {
    write<Args...>(kCategory, LogLevel::standard, format, args...);
  }

  /// A failure or an anomaly.
  template <class... Args>
  void error(Format<Args...> format, const Args&... args) const {
    write<Args...>(kCategory, LogLevel::error, format, args...);
  }

  /// One of the few lines that sum up a whole step, in a category of their own.
  template <class... Args>
  void summary(Format<Args...> format, const Args&... args) const {
    write<Args...>(kSummaryCategory, LogLevel::standard, format, args...);
  }

  /// A value of another type than was looked for. It stands in the framework's general category, among those of other
  /// clients, without the plug-in's name.
  template <class... Args>
  void lookupError(MessageFormat<std::type_identity_t<Args>...> format, const Args&... args) const {
    log<Args...>(framework_->ZTGetLogCategory(kGeneralCategory), LogLevel::error, format, args...);
  }

 private:
  static constexpr int kGeneralCategory = 0;
  static constexpr int kCategory = 8;
  static constexpr int kSummaryCategory = 14;

  template <class... Args>
  void write(int category, LogLevel level, Format<Args...> format, const Args&... args) const {
    log<std::string_view, Args...>(framework_->ZTGetLogCategory(category), level, format, kPlugInBundleIdentifier,
                                   args...);
  }

  platform::SyncFramework* framework_;
};

}  // namespace appsync
