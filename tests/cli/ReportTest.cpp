// Reports on the apps of a device.
#include <cmath>
#include <filesystem>
#include <limits>

#include <gmock/gmock.h>
#include <sys/stat.h>

#include "device/Device.h"
#include "plist/PropertyList.h"
#include "tests/support/ToolFixture.h"

namespace appsync::test {

namespace {

using cli::Json;
using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;
using testing::Not;

class Report : public ToolFixture {
 protected:
  /// Installs an app with this metadata or, for nullopt, without.
  void install(const std::string& identifier, const plist::Value& metadata = {}) const {
    publish(identifier);
    ASSERT_EQ(sync().status, 0);
    if (!metadata.isNull()) write(metadataOf(identifier), std::string(textOf(*plist::writeBinary(metadata))));
  }
  /// Returns the host path of an installed app's metadata.
  [[nodiscard]] std::string metadataOf(const std::string& identifier) const {
    const auto opened = device::Device::open(device(), device::Access::readOnly);
    const auto app =
        (*opened)->services().defaultRegistry().recordForIdentifier(identifier, platform::PlaceholderLookup::off);
    return device() + "/root" + app->bundleContainerPath().value_or("") + "/HarvoMetadata.plist";
  }
  [[nodiscard]] static plist::Dictionary owned(const plist::Dictionary& account) {
    return {{"com.corvel.HarvoStore.downloadInfo", plist::Dictionary{{"accountInfo", account}}}};
  }
  [[nodiscard]] Finished report(const std::string& option = {}) const {
    Finished finished = option.empty() ? runTool({"report", device()}) : runTool({"report", device(), option});
    EXPECT_EQ(finished.status, 0);
    EXPECT_EQ(finished.err, "");
    return finished;
  }
  [[nodiscard]] Json json() const { return Json::parse(report("--json").out); }
  [[nodiscard]] std::vector<std::string> identifiers() const { return json().at("corvelIDs"); }
};

TEST_F(Report, ShowsAppsAccountsAndRestrictions) {
  install("org.a", owned({{"CorvelID", "grace"}, {"DSPersonID", 7}, {"AltDSID", "000-7"}}));
  install("org.b", owned({{"CorvelID", "ada"}}));
  install("org.c");
  const std::uint64_t bytes = json().at("metrics").at("physicalSize");
  ASSERT_LT(bytes, 99'950U);
  ASSERT_EQ(runTool({"set", device(), "app-removal=no"}).status, 0);
  char size[32];
  std::snprintf(size, sizeof size, "%.1f kB", static_cast<double>(bytes) / 1000);
  EXPECT_EQ(report().out, "apps               3, " + std::string(size) +
                              "\n"
                              "can be purged      0 bytes\n"
                              "app-installation   unset\n"
                              "app-removal        no\n"
                              "\n"
                              "account identifiers\n"
                              "  ada\n"
                              "  grace\n"
                              "\n"
                              "accounts\n"
                              "  ada\n"
                              "  grace  DSID 7  altDSID 000-7\n");
}

TEST_F(Report, JsonHasTheDocumentedKeys) {
  install("org.a", owned({{"CorvelID", "grace"}, {"DSPersonID", 0xFFFF'FFFF'FFFF'FFFFU}, {"AltDSID", "000-7"}}));
  install("org.b", plist::Dictionary{{"corvelId", "ada"}});
  ASSERT_EQ(runTool({"set", device(), "app-installation=yes"}).status, 0);
  Json told = json();
  EXPECT_GT(told.at("metrics").at("physicalSize"), 10'000);
  told.at("metrics").erase("physicalSize");
  EXPECT_EQ(told, Json::parse(R"({
    "metrics": {"count": 2, "purgeableSize": 0},
    "corvelIDs": ["ada", "grace"],
    "accounts": [{"corvelID": "ada", "DSID": null, "altDSID": null},
                 {"corvelID": "grace", "DSID": 18446744073709551615, "altDSID": "000-7"}],
    "disabledAssetTypes": [],
    "restrictions": {"app-installation": "yes", "app-removal": "unset"}})"));
}

TEST_F(Report, SizesEqualThoseOfApps) {
  install("org.a");
  install("org.b");
  std::uint64_t sum = 0;
  for (const Json& app : Json::parse(runTool({"apps", device(), "--json"}).out))
    sum += app.at("bytes").get<std::uint64_t>();
  EXPECT_EQ(json().at("metrics").at("physicalSize"), sum);
}

TEST_F(Report, EmptyDeviceHasEmptyReport) {
  EXPECT_EQ(report().out,
            "apps               0, 0 bytes\ncan be purged      0 bytes\napp-installation   unset\n"
            "app-removal        unset\n");
  EXPECT_THAT(identifiers(), IsEmpty());
  EXPECT_THAT(json().at("accounts"), IsEmpty());
}

TEST_F(Report, RestrictionsDisableApplications) {
  ASSERT_EQ(runTool({"set", device(), "app-removal=no", "app-installation=no"}).status, 0);
  EXPECT_THAT(report().out, HasSubstr("\n\ndisabled\n  Application\n"));
  EXPECT_EQ(json().at("disabledAssetTypes"), Json::array({"Application"}));
}

TEST_F(Report, ShowsBothInconsistentIdentifiers) {
  plist::Dictionary metadata = owned({{"CorvelID", "newer"}});
  metadata.set("corvelId", "older");
  install("org.a", metadata);
  EXPECT_THAT(identifiers(), ElementsAre("newer", "older"));
  EXPECT_EQ(json().at("accounts").size(), 1U);
}

TEST_F(Report, EscapesMetadata) {
  install("org.a", owned({{"CorvelID", "\x1b[2J\xe2\x80\xae"}, {"AltDSID", "\x07\n"}}));
  install("org.b", owned({{"CorvelID", ""}, {"AltDSID", std::string(100'000, 'x')}}));
  const Finished plain = report();
  EXPECT_THAT(plain.out, HasSubstr("  \\x1b[2J\\u{202e}  altDSID \\x07\\x0a\n"));
  EXPECT_THAT(plain.out, HasSubstr("  (empty)  altDSID xxx"));
  EXPECT_THAT(plain.out, Not(HasSubstr("\x1b")));
  EXPECT_LT(plain.out.size(), 1000U);
  EXPECT_THAT(identifiers(), ElementsAre("", "\x1b[2J\xe2\x80\xae"));
}

TEST_F(Report, NonFiniteNumberIsNull) {
  install("org.a", owned({{"CorvelID", "x"}, {"DSPersonID", std::numeric_limits<double>::quiet_NaN()}}));
  EXPECT_EQ(json().at("accounts").at(0).at("DSID"), nullptr);
}

TEST_F(Report, WorksDuringSync) {
  install("org.a", plist::Dictionary{{"corvelId", "x"}});
  const auto held = device::Device::open(device(), device::Access::exclusive);
  ASSERT_TRUE(held.ok());
  EXPECT_THAT(identifiers(), ElementsAre("x"));
}

TEST_F(Report, MissingDeviceNamesInit) {
  const Finished finished = runTool({"report", path("nowhere"), "--json"});
  EXPECT_EQ(finished.status, 3);
  EXPECT_EQ(finished.out, "");
  EXPECT_THAT(finished.err, HasSubstr("appsync init"));
}

/// The second of three apps has malicious metadata: the report has the accounts of the others only.
class HostileMetadata : public Report {
 protected:
  void SetUp() override {
    Report::SetUp();
    for (const char* identifier : {"org.1", "org.2", "org.3"})
      publish(identifier, "1.0", {{"HarvoMetadata.plist", "{corvelId = \"" + std::string(identifier) + "\";}"}});
    ASSERT_EQ(sync().status, 0);
    ASSERT_THAT(identifiers(), ElementsAre("org.1", "org.2", "org.3"));
    metadata_ = metadataOf("org.2");
  }
  void expectTheOthers() const {
    EXPECT_THAT(identifiers(), ElementsAre("org.1", "org.3"));
    EXPECT_EQ(json().at("metrics").at("count"), 3);
    EXPECT_THAT(report().out, HasSubstr("accounts\n  org.1\n  org.3\n"));
  }
  [[nodiscard]] const std::string& metadata() const { return metadata_; }

 private:
  std::string metadata_;
};

TEST_F(HostileMetadata, WrongTypesAffectOnlyTheirApp) {
  for (const char* document : {"(a)", "text", "{corvelId = (x);}", "{corvelId = {};}", "{corvelId = <00>;}",
                               "{\"com.corvel.HarvoStore.downloadInfo\" = x;}",
                               "{\"com.corvel.HarvoStore.downloadInfo\" = {accountInfo = x;};}",
                               "{\"com.corvel.HarvoStore.downloadInfo\" = {accountInfo = {CorvelID = (x);};};}"}) {
    SCOPED_TRACE(document);
    write(metadata(), document);
    expectTheOthers();
  }
}

TEST_F(HostileMetadata, MissingMetadataAffectsOnlyItsApp) {
  std::filesystem::remove(metadata());
  expectTheOthers();
}

TEST_F(HostileMetadata, TruncatedMetadataAffectsOnlyItsApp) {
  for (const char* document : {"", "bplist00", "{corvelId = x", "<plist><dict><key>corvelId</key><string>x",
                               "<plist><dict><key>corvelId</key><string>\xff</string></dict></plist>"}) {
    SCOPED_TRACE(document);
    write(metadata(), document);
    expectTheOthers();
  }
}

TEST_F(HostileMetadata, UnreadableMetadataAffectsOnlyItsApp) {
  std::filesystem::remove(metadata());
  ASSERT_EQ(::mkfifo(metadata().c_str(), 0600), 0);
  expectTheOthers();
}

TEST_F(HostileMetadata, HugeMetadataAffectsOnlyItsApp) {
  std::filesystem::resize_file(metadata(), 100 << 20);
  expectTheOthers();
}

TEST_F(HostileMetadata, FolderAsMetadataAffectsOnlyItsApp) {
  std::filesystem::remove(metadata());
  std::filesystem::create_directory(metadata());
  expectTheOthers();
}

TEST_F(HostileMetadata, LinkAsMetadataAffectsOnlyItsApp) {
  write(path("outside.plist"), "{corvelId = stolen;}");
  for (const std::string& target : {path("outside.plist"), std::string("../../../../../../../outside.plist")}) {
    std::filesystem::remove(metadata());
    std::filesystem::create_symlink(target, metadata());
    expectTheOthers();
  }
}

}  // namespace

}  // namespace appsync::test
