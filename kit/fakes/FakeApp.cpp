#include "kit/fakes/FakeApp.h"

#include "platform/Keys.h"

namespace appsync::test {

namespace {

template <class Change>
FakeApp changed(const FakeApp& app, const Change& change) {
  FakeApp copy = app;
  change(copy);
  return copy;
}

}  // namespace

FakeApp::FakeApp(std::string appIdentifier)
    : identifier(std::move(appIdentifier)),
      bundleIdentifier(identifier),
      version("1.0"),
      containerPath("/var/mobile/Containers/Bundle/" + identifier),
      bundlePath(*containerPath + "/" + identifier + ".app"),
      applicationType(platform::kApplicationTypeUser) {}

FakeApp FakeApp::installed(std::string identifier) {
  return changed(FakeApp(std::move(identifier)), [](FakeApp& app) { app.isInstalled = true; });
}

FakeApp FakeApp::placeholder(std::string identifier, platform::TSInstallType type) {
  return changed(FakeApp(std::move(identifier)), [&](FakeApp& app) {
    app.isPlaceholder = true;
    app.installType = type;
    app.progress = std::make_shared<FakeInstallProgress>(app.identifier);
  });
}

FakeApp FakeApp::updating(std::string identifier, platform::TSInstallType type) {
  return changed(placeholder(std::move(identifier), type), [](FakeApp& app) { app.isInstalled = true; });
}

FakeApp FakeApp::withBundleIdentifier(std::optional<std::string> value) const {
  return changed(*this, [&](FakeApp& app) { app.bundleIdentifier = std::move(value); });
}

FakeApp FakeApp::withVersion(std::optional<std::string> value) const {
  return changed(*this, [&](FakeApp& app) { app.version = std::move(value); });
}

FakeApp FakeApp::withContainerPath(std::optional<std::string> value) const {
  return changed(*this, [&](FakeApp& app) { app.containerPath = std::move(value); });
}

FakeApp FakeApp::withBundlePath(std::optional<std::string> value) const {
  return changed(*this, [&](FakeApp& app) { app.bundlePath = std::move(value); });
}

FakeApp FakeApp::ofType(std::string_view type) const {
  return changed(*this, [&](FakeApp& app) { app.applicationType = type; });
}

FakeApp FakeApp::metByWalksOf(platform::BundleKind met) const {
  return changed(*this, [&](FakeApp& app) { app.kind = met; });
}

FakeApp FakeApp::withStaticDiskUsage(std::uint64_t bytes) const {
  return changed(*this, [&](FakeApp& app) { app.staticDiskUsage = bytes; });
}

FakeApp FakeApp::withInstallType(platform::TSInstallType type) const {
  return changed(*this, [&](FakeApp& app) { app.installType = type; });
}

FakeApp FakeApp::withMIDBasedSINF() const {
  return changed(*this, [](FakeApp& app) { app.hasMIDBasedSINF = true; });
}

FakeApp FakeApp::withProgress(platform::TSInstallState state, platform::TSInstallPhase phase) const {
  return changed(
      *this, [&](FakeApp& app) { app.progress = std::make_shared<FakeInstallProgress>(app.identifier, state, phase); });
}

FakeApp FakeApp::withoutProgress() const {
  return changed(*this, [](FakeApp& app) { app.progress = nullptr; });
}

}  // namespace appsync::test
