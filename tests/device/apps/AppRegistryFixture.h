// Fixture with a registry on a new device.
#pragma once

#include <memory>
#include <string>
#include <string_view>
#include <vector>

#include <gtest/gtest.h>

#include "device/apps/AppRegistry.h"
#include "device/packages/InstallerError.h"
#include "tests/support/TestDevice.h"

namespace appsync::test {

using Identifiers = std::vector<std::string>;

class AppRegistryTest : public testing::Test {
 protected:
  [[nodiscard]] device::AppRegistry& registry() { return device_.registry(); }

  Identifiers walk(platform::BundleKind kind) {
    Identifiers met;
    registry().enumerateBundlesOfType(
        kind, [&](const platform::BundleRecord& bundle, bool&) { met.push_back(bundle.applicationIdentifier()); });
    return met;
  }
  std::string inContainer(std::string_view identifier, const std::string& name) {
    return readHostFile(device_.host(*device_.record(identifier)->bundleContainerPath()) + "/" + name);
  }
  void expectFailure(const Status& status, device::InstallerFailure failure, const std::string& text) {
    ASSERT_FALSE(status.ok());
    EXPECT_EQ(status.error(), device::installerError(failure, text));
  }
  std::shared_ptr<platform::InstallProgress> progress(std::string_view identifier) {
    const auto app = device_.record(identifier);
    return app == nullptr ? nullptr : registry().installProgressForApplication(*app, platform::TSInstallPhase::Loading);
  }

  TestDevice device_;
};

}  // namespace appsync::test
