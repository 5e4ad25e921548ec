// Bringing the store metadata of installed apps up to date before a backup.
#include <string>

#include <gtest/gtest.h>

#include "kit/fakes/CallsInLog.h"
#include "kit/fakes/SyncFileBuilder.h"
#include "tests/support/ClientFixture.h"

namespace appsync::test {
namespace {

constexpr std::string_view kMetadata = "/var/mobile/Containers/Bundle/com.a/HarvoMetadata.plist";

class BackupPreparation : public ClientFixture {
 protected:
  void addApp(const plist::Dictionary& metadata, bool isBound = false) {
    putPropertyList(platform.files, kMetadata, metadata);
    const FakeApp app = FakeApp::installed("com.a");
    platform.registry.add(isBound ? app.withMIDBasedSINF() : app);
  }
  void prepare() {
    AppsClient& client = makeClient();
    logCalls(platform);
    client.prepareForBackup();
  }
  [[nodiscard]] plist::Dictionary metadata() { return *propertyListAt(platform.files, kMetadata)->dictionary(); }
  [[nodiscard]] bool wasRewritten() const { return platform.files.writes(kMetadata) > 0; }
};

TEST_F(BackupPreparation, EveryStepIsTakenInOrder) {
  addApp({{"DeviceBasedKLP", true}, {"is-auto-download", true}, {"title", "An App"}});
  prepare();
  EXPECT_TRUE(sameLines(
      {logged("preparing for backup"), called("registry.enumerateBundlesOfType 1"),

       called("fileSystem.readFile " + std::string(kMetadata)), logged("Updated DeviceBasedKLP state for : com.a to 0"),
       logged("clearing is-auto-download value for com.a"),
       called("fileSystem.writeFileAtomically " + std::string(kMetadata)), logged("finished preparing for backup")},
      platform.log.lines()));
  EXPECT_EQ(metadata(), (plist::Dictionary{{"DeviceBasedKLP", false}, {"title", "An App"}}));
}

TEST_F(BackupPreparation, AnAppWithNothingToSayIsNotRewritten) {
  addApp({{"title", "An App"}});
  prepare();
  EXPECT_TRUE(
      sameLines({logged("preparing for backup"), called("registry.enumerateBundlesOfType 1"),

                 called("fileSystem.readFile " + std::string(kMetadata)), logged("finished preparing for backup")},
                platform.log.lines()));
  EXPECT_FALSE(wasRewritten());
}

TEST_F(BackupPreparation, ALicenceThatIsNoLongerBoundBecomesFalse) {
  addApp({{"DeviceBasedKLP", true}});
  prepare();
  EXPECT_EQ(metadata(), (plist::Dictionary{{"DeviceBasedKLP", false}}));
}

TEST_F(BackupPreparation, ABoundLicenceIsNotedWhateverStoodThere) {
  for (const plist::Dictionary& before : {plist::Dictionary{}, plist::Dictionary{{"DeviceBasedKLP", false}},
                                          plist::Dictionary{{"DeviceBasedKLP", "x"}}}) {
    addApp(before, true);
    prepare();
    EXPECT_EQ(metadata(), (plist::Dictionary{{"DeviceBasedKLP", true}}));
    EXPECT_TRUE(platform.log.contains(logged("Updated DeviceBasedKLP state for : com.a to 1")));
  }
}

TEST_F(BackupPreparation, AValueThatHeldIsWrittenAllTheSame) {
  addApp({{"DeviceBasedKLP", true}}, true);
  prepare();
  EXPECT_EQ(platform.files.writes(kMetadata), 1U);
}

TEST_F(BackupPreparation, AnAutomaticDownloadThatIsFalseCausesNoRewrite) {
  addApp({{"is-auto-download", false}});
  prepare();
  EXPECT_FALSE(wasRewritten());
}

TEST_F(BackupPreparation, AFalseAutomaticDownloadStaysBesideAnotherChange) {
  addApp({{"is-auto-download", false}}, true);
  prepare();
  EXPECT_EQ(metadata(), (plist::Dictionary{{"DeviceBasedKLP", true}, {"is-auto-download", false}}));
}

TEST_F(BackupPreparation, ABinaryFileComesBackAsXML) {
  platform.registry.add(FakeApp::installed("com.a"));
  platform.files.put(kMetadata, binaryForm(plist::Dictionary{{"is-auto-download", true}}));
  prepare();
  EXPECT_EQ(platform.files.contents(kMetadata), xmlForm(plist::Dictionary{}));
}

TEST_F(BackupPreparation, AFileThatIsMissingOrUnreadableIsPassedOver) {
  platform.registry.add(FakeApp::installed("com.none").withMIDBasedSINF());
  platform.registry.add(FakeApp::installed("com.broken").withMIDBasedSINF());
  platform.registry.add(FakeApp::installed("com.array").withMIDBasedSINF());
  const std::string folder = "/var/mobile/Containers/Bundle/";
  platform.files.put(folder + "com.broken/HarvoMetadata.plist", "bplist00");
  putPropertyList(platform.files, folder + "com.array/HarvoMetadata.plist", plist::Array{true});
  addApp({{"is-auto-download", true}});
  prepare();
  EXPECT_EQ(metadata(), plist::Dictionary{});
  EXPECT_EQ(platform.journal.count("fileSystem.writeFileAtomically"), 1U);
  EXPECT_EQ(platform.files.text(folder + "com.broken/HarvoMetadata.plist"), "bplist00");
}

TEST_F(BackupPreparation, ABundleThatIsNoAppAndAnAppWithoutAContainerArePassedOver) {
  platform.registry.addBundle("com.extension", platform::BundleKind::user);
  platform.registry.add(FakeApp::installed("com.b").withContainerPath(std::nullopt).withMIDBasedSINF());
  prepare();
  EXPECT_EQ(platform.journal.count("fileSystem."), 0U);
  EXPECT_TRUE(platform.log.contains(logged("finished preparing for backup")));
}

TEST_F(BackupPreparation, ASystemAppIsNotVisited) {
  putPropertyList(platform.files, kMetadata, plist::Dictionary{{"is-auto-download", true}});
  platform.registry.add(FakeApp::installed("com.a").ofType(platform::kApplicationTypeSystem));
  prepare();
  EXPECT_FALSE(wasRewritten());
}

TEST_F(BackupPreparation, AFileThatCannotBeWrittenStopsNobody) {
  addApp({{"is-auto-download", true}});
  platform.registry.add(FakeApp::installed("com.b"));
  const std::string other = "/var/mobile/Containers/Bundle/com.b/HarvoMetadata.plist";
  putPropertyList(platform.files, other, plist::Dictionary{{"is-auto-download", 1}});
  platform.files.failures.failAlways(FileOperation::writeFileAtomically, kMetadata, {"POSIX", 28, "full", nullptr});
  prepare();
  EXPECT_EQ(platform.files.writes(other), 1U);
  EXPECT_TRUE(platform.log.contains(logged("finished preparing for backup")));
}

}  // namespace
}  // namespace appsync::test
