// The connection on which the install-coordination service reports.
#include "core/AppsClient.h"

namespace appsync {

void AppsClient::setupInstallCoordinatorObserver() {
  if (_appInstallObserver) return;
  _appInstallObserver = _platform.installCoordination().initWithMachServiceName(
      "com.corvel.zeph.xpc.cnappobserverdelegate", {platform::ClientIdentity::CXClientSync}, *this);
}

}  // namespace appsync
