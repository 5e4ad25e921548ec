#include "device/Licence.h"

#include "base/PropertyList.h"

namespace appsync::device {

bool isDeviceBound(ByteView licence) {
  if (licence.empty()) return false;
  const auto document = plist::read(licence);
  const plist::Value* device = document ? document->find("DeviceIdentifier") : nullptr;
  return device != nullptr && device->string();
}

}  // namespace appsync::device
