// `appsync pack`, `appsync plist` and other commands that write files.
#include <filesystem>
#include <fstream>
#include <iterator>

#include <gmock/gmock.h>

#include "plist/PropertyList.h"
#include "tests/support/NamedPipe.h"
#include "tests/support/ToolFixture.h"

namespace appsync::test {

namespace {

using testing::ElementsAre;
using testing::HasSubstr;

class Pack : public ToolFixture {
 protected:
  void SetUp() override {
    ToolFixture::SetUp();
    makeApp(path("Notes.app"));
  }
  void makeApp(const std::string& app, const std::string& info = infoPlist("org.notes", "1.2")) const {
    std::filesystem::create_directories(app + "/data");
    write(app + "/Info.plist", info);
    write(app + "/Icon.png", "a picture");
    write(app + "/data/text", "text");
  }
  [[nodiscard]] static std::string contentOf(const std::string& path) {
    std::ifstream file(path, std::ios::binary);
    return {std::istreambuf_iterator<char>(file), {}};
  }
  void expectRefused(const std::string& folder, const std::string& reason) const {
    const Finished run = runTool({"pack", folder, "-o", path("out.zip")});
    EXPECT_EQ(run.status, 3);
    EXPECT_THAT(run.err, HasSubstr(reason));
    EXPECT_FALSE(std::filesystem::exists(path("out.zip")));
  }
};

TEST_F(Pack, PackageCanBeInstalled) {
  ASSERT_EQ(runTool({"pack", path("Notes.app"), "-o", library() + "/notes.zip"}).status, 0);
  EXPECT_EQ(sync().status, 0);
  EXPECT_THAT(apps(), ElementsAre("org.notes 1.2"));
}

TEST_F(Pack, IsReproducible) {
  ASSERT_EQ(runTool({"pack", path("Notes.app"), "-o", path("one.zip")}).status, 0);
  std::filesystem::create_directory(path("elsewhere"));
  makeApp(path("elsewhere/Notes.app"));
  ASSERT_EQ(runTool({"pack", path("elsewhere/Notes.app"), "-o", path("two.zip")},
                    {.environment = {{"TZ", "Pacific/Auckland"}, {"LC_ALL", "C"}}})
                .status,
            0);
  EXPECT_EQ(contentOf(path("one.zip")), contentOf(path("two.zip")));
}

TEST_F(Pack, AddsMetadataOfTheFolder) {
  makeApp(path("holder/Notes.app"));
  write(path("holder/HarvoMetadata.plist"), infoPlist("org.notes"));
  write(path("holder/README"), "not packed");
  ASSERT_EQ(runTool({"pack", path("holder"), "-o", path("out.zip")}).status, 0);
  EXPECT_THAT(contentOf(path("out.zip")), HasSubstr("HarvoMetadata.plist"));
  EXPECT_THAT(contentOf(path("out.zip")), testing::Not(HasSubstr("README")));
}

TEST_F(Pack, KeepsNamesInAnyScript) {
  write(path("Notes.app/größe-潮汐"), "x");
  ASSERT_EQ(
      runTool({"pack", path("Notes.app"), "-o", library() + "/notes.zip"}, {.environment = {{"LC_ALL", "C"}}}).status,
      0);
  EXPECT_EQ(sync().status, 0);
}

TEST_F(Pack, RefusesFolderWithoutApp) {
  std::filesystem::create_directory(path("empty"));
  expectRefused(path("empty"), "is not an app and has none in it");
}

TEST_F(Pack, RefusesSeveralApps) {
  makeApp(path("several/One.app"));
  makeApp(path("several/Two.app"));
  expectRefused(path("several"), "contains several apps");
}

TEST_F(Pack, RefusesAppWithoutInfo) {
  std::filesystem::remove(path("Notes.app/Info.plist"));
  expectRefused(path("Notes.app"), "Info.plist");
}

TEST_F(Pack, RefusesInvalidIdentifier) {
  makeApp(path("Notes.app"), infoPlist("../escape"));
  expectRefused(path("Notes.app"), "Info.plist");
}

TEST_F(Pack, RefusesIconOutsideTheApp) {
  write(path("outside.png"), "a picture");
  for (const std::string name : {"../outside.png", "./../outside.png"}) {
    write(path("Notes.app/Info.plist"),
          R"({BundleIdentifier = "org.a"; BundleVersion = "1"; BundleDisplayName = "A"; BundleIconFile = ")" + name +
              R"(";})");
    expectRefused(path("Notes.app"),
                  "names under BundleIconFile a file that the app does not have; add the file or remove the key");
  }
}

TEST_F(Pack, RefusesMissingIcon) {
  std::filesystem::remove(path("Notes.app/Icon.png"));
  expectRefused(path("Notes.app"), "BundleIconFile");
}

TEST_F(Pack, RefusesLink) {
  std::filesystem::create_symlink("/etc/passwd", path("Notes.app/link"));
  expectRefused(path("Notes.app"), "is a link");
}

TEST_F(Pack, RefusesPipeAsInfo) {
  std::filesystem::remove(path("Notes.app/Info.plist"));
  makePipe(path("Notes.app/Info.plist"));
  expectRefused(path("Notes.app"), "Info.plist cannot be read: it is a pipe or a device, not a file");
}

TEST_F(Pack, WritesToPipe) {
  const NamedPipe pipe(path("pipe"));
  EXPECT_EQ(runTool({"pack", path("Notes.app"), "-o", path("pipe")}).out,
            "Packed Notes 1.2 as " + path("pipe") + ".\n");
  ASSERT_EQ(runTool({"pack", path("Notes.app"), "-o", path("file")}).status, 0);
  EXPECT_EQ(pipe.contents(), contentOf(path("file")));
  EXPECT_TRUE(pipe.isThere());
}

TEST_F(Pack, WritesOnlyThePackageToStandardOutput) {
  const Finished run = runTool({"pack", path("Notes.app"), "-o", "-"});
  EXPECT_EQ(run.status, 0);
  EXPECT_EQ(run.err, "");
  ASSERT_EQ(runTool({"pack", path("Notes.app"), "-o", path("file")}).status, 0);
  EXPECT_EQ(run.out, contentOf(path("file")));
  EXPECT_FALSE(std::filesystem::exists("-"));
}

TEST_F(Pack, ReportsFullStandardOutput) {
  const Finished run = runTool({"pack", path("Notes.app"), "-o", "-"}, {.output = OutputTo::full});
  EXPECT_EQ(run.status, 3);
  EXPECT_EQ(run.err, "appsync: standard output cannot be written: No space left on device\n");
}

TEST_F(Pack, WritesScreenToPipeAndStandardOutput) {
  const NamedPipe pipe(path("pipe"));
  const Finished toPipe = runTool({"screen", device(), "-o", path("pipe")});
  EXPECT_EQ(toPipe.out, "Drew the home screen as " + path("pipe") + ".\n");
  const Finished toOutput = runTool({"screen", device(), "-o", "-"});
  EXPECT_EQ(toOutput.status, 0);
  EXPECT_TRUE(toOutput.out.starts_with("\x89PNG"));
  EXPECT_EQ(pipe.contents(), toOutput.out);
  EXPECT_TRUE(pipe.isThere());
}

class Plist : public Pack {};

TEST_F(Plist, ConversionInPlaceKeepsMode) {
  write(path("in"), "{ a = b; }");
  std::filesystem::permissions(path("in"), std::filesystem::perms::owner_read | std::filesystem::perms::owner_write);
  ASSERT_EQ(runTool({"plist", path("in"), "-o", path("in")}).status, 0);
  EXPECT_EQ(std::filesystem::status(path("in")).permissions(),
            std::filesystem::perms::owner_read | std::filesystem::perms::owner_write);
}

TEST_F(Plist, ConvertsBetweenAllFormats) {
  const std::string xml = infoPlist("org.notes", "1.2");
  write(path("in"), xml);
  ASSERT_EQ(runTool({"plist", path("in"), "--to", "binary", "-o", path("binary")}).status, 0);
  EXPECT_TRUE(contentOf(path("binary")).starts_with("bplist00"));
  EXPECT_EQ(runTool({"plist", path("binary")}).out, xml);
  EXPECT_EQ(cli::Json::parse(runTool({"plist", path("binary"), "--to", "json"}).out).at("BundleVersion"), "1.2");
}

TEST_F(Plist, OutputIsSafeForTerminalsAndLossless) {
  const std::string text = "\x7f \xc2\x9b[2J \xe2\x80\xae \xf3\xa0\x81\x81 é潮";
  write(path("in"), "<plist><dict><key>" + text + "</key><string>" + text + "</string></dict></plist>");
  const Finished xml = runTool({"plist", path("in")});
  const std::string numbers = "&#x7f; &#x9b;[2J &#x202e; &#xe0041; é潮";
  EXPECT_THAT(xml.out, HasSubstr("<key>" + numbers + "</key>"));
  EXPECT_THAT(xml.out, HasSubstr("<string>" + numbers + "</string>"));
  write(path("again"), xml.out);
  EXPECT_EQ(runTool({"plist", path("again"), "--to", "binary"}).out,
            runTool({"plist", path("in"), "--to", "binary"}).out);
  const Finished json = runTool({"plist", path("again"), "--to", "json"});
  EXPECT_EQ(cli::Json::parse(json.out).at(text), text);
  EXPECT_THAT(json.out, testing::Not(HasSubstr("\xc2\x9b")));
}

TEST_F(Plist, RefusesExcessiveExpansion) {
  const plist::Value icons(plist::Array(20'000, Bytes(65'536, std::byte{5})));
  write(path("icons"), textOf(*plist::writeBinary(icons)));
  for (const char* form : {"json", "xml"}) {
    const Finished run = runTool({"plist", path("icons"), "--to", form});
    EXPECT_EQ(run.status, 3) << form;
    EXPECT_THAT(run.err, HasSubstr("icons cannot be converted to " + std::string(form) + ": Too many values"));
  }
  EXPECT_EQ(runTool({"plist", path("icons"), "--to", "binary", "-o", path("same")}).status, 0);
  EXPECT_EQ(contentOf(path("same")), contentOf(path("icons")));
}

TEST_F(Plist, ReadsStandardInput) {
  const Finished run = runTool({"plist", "-", "--to", "json"}, {.input = "{ a = (1, 2); }"});
  EXPECT_EQ(cli::Json::parse(run.out), cli::Json::parse(R"({"a":["1","2"]})"));
}

TEST_F(Plist, RefusesInvalidPropertyList) {
  write(path("in"), "bplist00");
  const Finished run = runTool({"plist", path("in")});
  EXPECT_EQ(run.status, 3);
  EXPECT_THAT(run.err, HasSubstr("cannot be read as a property list"));
}

TEST_F(Plist, FailureKeepsTheOutput) {
  write(path("in"), "<plist>");
  write(path("out"), "before");
  EXPECT_EQ(runTool({"plist", path("in"), "-o", path("out")}).status, 3);
  EXPECT_EQ(contentOf(path("out")), "before");
}

}  // namespace

}  // namespace appsync::test
