// Licences that are bound to a device.
#include <string>

#include <gtest/gtest.h>

#include "device/apps/AppTable.h"
#include "plist/PropertyList.h"
#include "tests/device/apps/AppRegistryFixture.h"

namespace appsync::test {
namespace {

plist::Value boundLicence() {
  return plist::Dictionary{{"DeviceIdentifier", "device-1"}, {"Key", plist::Value::data(bytesOf("secret"))}};
}

TEST(Licence, LicenceWithDeviceIdentifierIsBound) {
  EXPECT_TRUE(device::isDeviceBound(*plist::writeXML(boundLicence())));
  EXPECT_TRUE(device::isDeviceBound(*plist::writeBinary(boundLicence())));
}

TEST(Licence, OtherLicencesAreNotBound) {
  EXPECT_FALSE(device::isDeviceBound({}));
  EXPECT_FALSE(device::isDeviceBound(bytesOf("a licence")));
  EXPECT_FALSE(device::isDeviceBound(bytesOf("bplist00")));
  EXPECT_FALSE(device::isDeviceBound(*plist::writeXML(plist::Array{boundLicence()})));
  EXPECT_FALSE(device::isDeviceBound(*plist::writeXML(plist::Dictionary{{"DeviceIdentifier", 7}})));
}

class LicensedApp : public AppRegistryTest {
 protected:
  void install(std::string_view version, const plist::Value& licence) {
    plist::Dictionary options = TestDevice::customer("com.a");
    options.set(platform::kLicenceDataKey, licence);
    ASSERT_TRUE(registry().installApplication(device_.stage("a.zip", appPackage("com.a", version)), options).ok());
  }
  [[nodiscard]] bool isBound() { return device_.record("com.a")->hasMIDBasedSINF(); }
};

TEST_F(LicensedApp, RecordReportsBoundLicence) {
  install("1.0", *plist::writeXML(boundLicence()));
  EXPECT_TRUE(isBound());
  device_.reopen();
  EXPECT_TRUE(isBound());
}

TEST_F(LicensedApp, InstallReplacesOrKeepsLicence) {
  install("1.0", *plist::writeXML(boundLicence()));
  install("1.1", nullptr);
  EXPECT_TRUE(isBound());
  install("1.2", plist::Value::data(bytesOf("for everybody")));
  EXPECT_FALSE(isBound());
}

}  // namespace
}  // namespace appsync::test
