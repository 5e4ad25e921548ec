#include "device/apps/Licence.h"

#include "plist/PropertyList.h"

namespace appsync::device {

bool isDeviceBound(ByteView licence) {
  if (licence.empty()) return false;
  const auto document = plist::read(licence);
  return document && stringIn(document->find("DeviceIdentifier"));
}

}  // namespace appsync::device
