// appsync-port-daemon MODULE DIRECTORY: a daemon that loads the plug-in. Two services are real and store their files in
// DIRECTORY; all others are the kit's fakes. A port replaces these one by one.
#include <exception>
#include <filesystem>
#include <fstream>
#include <iostream>
#include <string>

#include "Daemon.h"
#include "Plugin.h"
#include "RemovedApps.h"
#include "TextTransactionLog.h"
#include "kit/fakes/FakePlatform.h"

namespace {

using appsync::test::FakeApp;
using appsync::test::FakePlatform;

void printApps(const FakePlatform& device) {
  for (const std::string& identifier : device.registry.identifiers()) {
    const FakeApp app = *device.registry.app(identifier);
    std::cout << (app.isInstalled ? "installed: " : "placeholder: ") << identifier << " "
              << app.version.value_or("(no version)") << "\n";
  }
}

void printTransactions(const std::string& path) {
  std::cout << "--- transaction log\n";
  if (std::ifstream file(path); file.peek() != std::ifstream::traits_type::eof()) std::cout << file.rdbuf();
}

void printLog(const FakePlatform& device) {
  std::cout << "--- log of the sync framework\n";
  for (const appsync::test::LogLine& line : device.log.lines())
    std::cout << line << "\n";
}

int run(const std::string& modulePath, const std::string& folder) {
  std::filesystem::create_directories(folder);
  // The services must outlive the platform that refers to them, and the platform must outlive the client.
  port::TextTransactionLog transactions(folder + "/transactions.txt");
  port::RemovedApps removedApps(folder + "/removed-apps.txt");
  FakePlatform device;
  device.use(transactions);
  device.use(removedApps);

  // The device has one app, and the user has removed another one since the last sync.
  device.bundleFolders.setMainBundleIdentifier("com.corvel.zeph");  // The plug-in checks that it runs in the daemon.
  device.registry.add(FakeApp::installed("com.example.notes"));
  if (const int failure = removedApps.add("com.example.chess"); failure != 0) {
    std::cerr << folder << " cannot be used (error " << failure << ")\n";
    return 3;
  }

  const auto client = port::loadPlugin(modulePath, device);
  device.notify.deliver(appsync::platform::kZTStartupCompleteNotification);
  const bool isDone = port::sync(device, *client, {{"com.example.tides", "2.0", "Tides"}});
  printApps(device);
  printTransactions(folder + "/transactions.txt");
  printLog(device);
  const auto tides = device.registry.app("com.example.tides");
  return isDone && tides && tides->isInstalled ? 0 : 1;
}

}  // namespace

int main(int count, char** arguments) {
  if (count != 3) {
    std::cerr << "usage: appsync-port-daemon MODULE DIRECTORY\n";
    return 2;
  }
  try {
    return run(arguments[1], arguments[2]);
  } catch (const std::exception& failure) {
    std::cerr << "appsync-port-daemon: " << failure.what() << "\n";
    return 3;
  }
}
