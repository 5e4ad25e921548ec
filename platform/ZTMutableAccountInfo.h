// The sync framework's record of one store account.
#pragma once

#include <optional>
#include <set>
#include <string>
#include <string_view>
#include <utility>

#include "base/Describe.h"
#include "plist/PropertyList.h"

namespace appsync::platform {

/// A store account that owns apps of the device. A plain value.
class ZTMutableAccountInfo {
 public:
  /// The account's person identifier in the directory service: an integer or a real number, unmodified.
  [[nodiscard]] const std::optional<plist::Value>& DSID() const { return dsid_; }
  void setDSID(std::optional<plist::Value> number) { dsid_ = std::move(number); }

  /// The account's identifier: any text, unmodified.
  [[nodiscard]] const std::string& corvelID() const { return corvelID_; }
  void setCorvelID(std::string identifier) { corvelID_ = std::move(identifier); }

  /// The alternative identifier in the directory service.
  [[nodiscard]] const std::optional<std::string>& altDSID() const { return altDSID_; }
  void setAltDSID(std::optional<std::string> identifier) { altDSID_ = std::move(identifier); }

  bool operator==(const ZTMutableAccountInfo&) const = default;

  /// For logs: "<ZTMutableAccountInfo corvelID a@example.org DSID 7 altDSID (null)>".
  [[nodiscard]] std::string description() const {
    return "<ZTMutableAccountInfo corvelID " + corvelID_ + " DSID " + appsync::description(dsid_) + " altDSID " +
           appsync::description(altDSID_) + ">";
  }

 private:
  std::optional<plist::Value> dsid_;
  std::string corvelID_;
  std::optional<std::string> altDSID_;
};

/// Orders accounts by the bytes of `corvelID`; enables look-up by `corvelID`.
struct ByCorvelID {
  using is_transparent = void;  // NOLINT(readability-identifier-naming): the standard library looks for this name.

  template <class Left, class Right>
  bool operator()(const Left& left, const Right& right) const {
    return identifier(left) < identifier(right);
  }

 private:
  static std::string_view identifier(std::string_view text) { return text; }
  static std::string_view identifier(const ZTMutableAccountInfo& account) { return account.corvelID(); }
};

/// Accounts with distinct `corvelID`s, in the order of their bytes.
using ZTAccountInfos = std::set<ZTMutableAccountInfo, ByCorvelID>;

}  // namespace appsync::platform
