#include <fstream>
#include <string>
#include <vector>

#include <fcntl.h>
#include <gtest/gtest.h>

#include "device/packages/InstallerError.h"
#include "device/packages/Package.h"
#include "device/packages/PackageUnpacker.h"
#include "device/packages/PackageWriter.h"
#include "tests/support/TestDevice.h"
#include "tests/support/ZipArchive.h"

namespace appsync::test {

using device::InstallerFailure;
using device::PackageInfo;
using device::PackageLimits;

namespace {

/// An invalid package.
struct Refusal {
  std::string name;
  std::string bytes;
  InstallerFailure failure;
  std::string text;  ///< of the error
};

std::ostream& operator<<(std::ostream& out, const Refusal& refusal) {
  return out << refusal.name;
}

std::string with(const ZipEntry& entry) {
  return appPackage("com.a", "1.0", {entry});
}

std::string cut(const std::string& package, std::size_t bytes) {
  return package.substr(0, package.size() - bytes);
}

std::vector<Refusal> refusals() {
  const std::string again = "; make the package again";
  const auto unsafe = [&](const std::string& name, const std::string& entry) {
    return Refusal{name, with({entry, "x"}), InstallerFailure::unsafeEntry,
                   "the package holds \"" + entry + "\", a name that may lead outside it" + again};
  };
  return {
      {"Text", "hello", InstallerFailure::notAPackage,
       "this is not a package; a package is a zip archive of an app folder"},
      {"EmptyFile", "", InstallerFailure::notAPackage,
       "this is not a package; a package is a zip archive of an app folder"},
      {"EmptyArchive", zipArchive({}), InstallerFailure::noApp, "the package is empty; pack an app folder"},
      {"CutShort", cut(appPackage("com.a"), 200), InstallerFailure::damaged,
       "the package is truncated or damaged; copy it again"},
      {"CutShortByOne", cut(appPackage("com.a"), 1), InstallerFailure::damaged,
       "the package is truncated or damaged; copy it again"},
      unsafe("AbsoluteName", "/Notes.app/x"),
      unsafe("WayUp", "Notes.app/../../x"),
      unsafe("WayUpInside", "Notes.app/../Notes.app/x"),
      {"Backslashes", with({"Notes.app\\..\\x", "x"}), InstallerFailure::unsafeEntry,
       "the package holds \"Notes.app/../x\", a name that may lead outside it" + again},
      unsafe("BackslashInside", "Notes.app/a\\b"),
      unsafe("DotComponent", "Notes.app/./x"),
      unsafe("EmptyComponent", "Notes.app//x"),
      {"Link", with({"Notes.app/link", "/etc/passwd", S_IFLNK | 0777}), InstallerFailure::unsafeEntry,
       "the package holds \"Notes.app/link\", which is a link; pack files and folders only"},
      {"Device", with({"Notes.app/null", "", S_IFCHR | 0666}), InstallerFailure::unsafeEntry,
       "the package holds \"Notes.app/null\", which is a device; pack files and folders only"},
      {"Socket", with({"Notes.app/socket", "", S_IFSOCK | 0666}), InstallerFailure::unsafeEntry,
       "the package holds \"Notes.app/socket\", which is a device; pack files and folders only"},
      {"Twice", with({"Notes.app/Notes", "other"}), InstallerFailure::duplicateEntry,
       "the package holds \"Notes.app/Notes\" twice" + again},
      {"FolderTwice", with({"Notes.app/", "", S_IFDIR | 0755}), InstallerFailure::duplicateEntry,
       "the package holds \"Notes.app\" twice" + again},
      {"TwoApps", with({"Other.app/Info.plist", infoPlist("com.b")}), InstallerFailure::severalApps,
       "the package holds two apps, \"Notes.app\" and \"Other.app\"; make a package of each"},
      {"Stray", with({"Elsewhere/Notes.txt", "x"}), InstallerFailure::strayEntry,
       "the package holds \"Elsewhere/Notes.txt\", which belongs to no app; take it out of the package"},
      {"MetadataAsFolder", with({"HarvoMetadata.plist/x", "x"}), InstallerFailure::strayEntry,
       "the package holds \"HarvoMetadata.plist/x\", which belongs to no app; take it out of the package"},
      {"AppAsFile", zipArchive({{"Notes.app", "x"}}), InstallerFailure::strayEntry,
       "the package holds \"Notes.app\", which belongs to no app; take it out of the package"},
      {"NoApp", zipArchive({{"HarvoArtwork", "x"}}), InstallerFailure::noApp,
       "the package holds no app; pack a folder \"Name.app\""},
      {"NoInfo", zipArchive({{"Notes.app/Notes", "x"}}), InstallerFailure::noApp,
       "the package's \"Notes.app\" holds no Info.plist and is no app; add one and pack it again"},
      {"InfoElsewhere", zipArchive({{"Notes.app/sub/Info.plist", infoPlist("com.a")}}), InstallerFailure::noApp,
       "the package's \"Notes.app\" holds no Info.plist and is no app; add one and pack it again"},
      {"InfoIsAList", zipArchive({{"Notes.app/Info.plist", "( a, b )"}}), InstallerFailure::badInfo,
       "the app's Info.plist is no dictionary; write it again"},
      {"NoIdentifier", zipArchive({{"Notes.app/Info.plist", "{ a = b; }"}}), InstallerFailure::badInfo,
       "the app's Info.plist names no BundleIdentifier; add one"},
      {"BadIdentifier", zipArchive({{"Notes.app/Info.plist", infoPlist("com/a")}}), InstallerFailure::badIdentifier,
       "the app's bundle identifier \"com/a\" may have only letters, digits, '-', '.' and '_', at most 200 and no dot "
       "first; choose another"},
      {"Encrypted", zipArchive({{"Notes.app/Info.plist", "secret", S_IFREG | 0644, true}}), InstallerFailure::encrypted,
       "the package is encrypted at \"Notes.app/Info.plist\"; make it again without a password"},
      {"WrongChecksum", zipArchive({{"Notes.app/Info.plist", infoPlist("com.a"), S_IFREG | 0644, false, true}}),
       InstallerFailure::damaged, ""},
      {"WrongChecksumOfAnotherFile",
       appPackage("com.a", "1.0", {{"Notes.app/more", "content", S_IFREG | 0644, false, true}}),
       InstallerFailure::damaged, ""},
      {"FileUnderAFile", with({"Notes.app/Notes/below", "x"}), InstallerFailure::duplicateEntry,
       "the package holds \"Notes.app/Notes/below\" as a file and as a folder; make the package again"},
      {"FileAsFolder", with({"Notes.app/data", "x"}), InstallerFailure::duplicateEntry,
       "the package holds \"Notes.app/data\" as a file and as a folder; make the package again"},
  };
}

class RefusedPackage : public testing::TestWithParam<Refusal> {};

constexpr auto nameOfRefusal = [](const auto& refusal) { return refusal.param.name; };

INSTANTIATE_TEST_SUITE_P(Package, RefusedPackage, testing::ValuesIn(refusals()), nameOfRefusal);

/// Unpacks a package into a new directory.
Result<device::UnpackedPackage> unpack(const std::string& package, const std::string& folder, PackageLimits limits) {
  std::filesystem::create_directories(folder);
  device::FileDescriptor file(::open(package.c_str(), O_RDONLY));
  const device::FileDescriptor container(::open(folder.c_str(), O_RDONLY | O_DIRECTORY));
  Result<device::PackageReader> reader = device::PackageReader::open(std::move(file), limits);
  if (!reader) return reader.error();
  return device::unpackPackage(*reader, container.get(), [](double) { return true; });
}

class Package : public testing::Test {
 protected:
  std::string write(const std::string& bytes) {
    writeHostFile(folder_.path("package"), bytes);
    return folder_.path("package");
  }
  std::string unpacked(const std::string& name) { return readHostFile(folder_.path("container/" + name)); }
  Result<device::UnpackedPackage> unpackHere(const std::string& bytes, PackageLimits limits = {}) {
    return unpack(write(bytes), folder_.path("container"), limits);
  }

  TemporaryFolder folder_;
};

}  // namespace

TEST_P(RefusedPackage, LeavesNoTrace) {
  TestDevice device;
  const Status installed = device.tryInstall("com.a", GetParam().bytes);
  ASSERT_FALSE(installed.ok());
  EXPECT_EQ(installed.error().domain, platform::kInstallerErrorDomain) << installed.error().text;
  EXPECT_EQ(installed.error().code, static_cast<long>(GetParam().failure)) << installed.error().text;
  if (!GetParam().text.empty()) {
    EXPECT_EQ(installed.error().text, GetParam().text);
  }
  EXPECT_EQ(device.record("com.a"), nullptr);
  EXPECT_EQ(device.containers(), 0);
  EXPECT_TRUE(device.isTidy());
}

TEST_F(Package, UnpacksFoldersAndModes) {
  const auto package = unpackHere(appPackage("com.a", "2.5", {{"HarvoArtwork", "art"}}));
  ASSERT_TRUE(package.ok()) << package.error().text;
  EXPECT_EQ(package->appFolder, "Notes.app");
  EXPECT_EQ(package->info.identifier, "com.a");
  EXPECT_EQ(package->info.version, "2.5");
  EXPECT_EQ(unpacked("Notes.app/data/deep/file"), std::string(5000, 'x'));
  EXPECT_EQ(unpacked("HarvoArtwork"), "art");
  EXPECT_EQ(package->bytes, 5000U + 9 + 10 + 3 + infoPlist("com.a", "2.5").size());
  using std::filesystem::perms;
  const auto executable = std::filesystem::status(folder_.path("container/Notes.app/Notes")).permissions();
  EXPECT_NE(executable & perms::owner_exec, perms::none);
  const auto plain = std::filesystem::status(folder_.path("container/Notes.app/Icon.png")).permissions();
  EXPECT_EQ(plain & perms::owner_exec, perms::none);
}

TEST_F(Package, AcceptsNamesOfAnyScript) {
  const std::vector<ZipEntry> entries{{"Café 日本.app/Info.plist", infoPlist("com.a")}, {"Café 日本.app/ü", "x"}};
  const auto package = unpackHere(zipArchive(entries));
  ASSERT_TRUE(package.ok()) << package.error().text;
  EXPECT_EQ(package->appFolder, "Café 日本.app");
  EXPECT_EQ(unpacked("Café 日本.app/ü"), "x");
}

TEST_F(Package, AcceptsInfoAsLastEntry) {
  const auto package =
      unpackHere(zipArchive({{"A.app/a/b/c", "1"}, {"A.app/a/d", "2"}, {"A.app/Info.plist", infoPlist("com.a")}}));
  ASSERT_TRUE(package.ok()) << package.error().text;
  EXPECT_EQ(unpacked("A.app/a/b/c"), "1");
  EXPECT_EQ(unpacked("A.app/a/d"), "2");
}

TEST_F(Package, AcceptsInfoInAnyFormat) {
  const plist::Value info = plist::Dictionary{{platform::BundleIdentifierKey, "com.a"}};
  const auto binary = plist::writeBinary(info);
  EXPECT_TRUE(unpackHere(zipArchive({{"A.app/Info.plist", std::string(textOf(*binary))}})).ok());
  std::filesystem::remove_all(folder_.path("container"));
  EXPECT_TRUE(unpackHere(zipArchive({{"A.app/Info.plist", "{ BundleIdentifier = \"com.a\"; }"}})).ok());
}

TEST_F(Package, RejectsTooManyEntries) {
  const auto package = unpackHere(appPackage("com.a"), {.entries = 3});
  ASSERT_FALSE(package.ok());
  EXPECT_EQ(package.error().text,
            "the package has more than 3 entries, the most that are allowed; make the app smaller");
}

TEST_F(Package, RejectsTooManyBytesBeforeUnpacking) {
  const auto package = unpackHere(zipArchive({{"A.app/big", std::string(2000, 'x')}}), {.unpackedBytes = 1999});
  ASSERT_FALSE(package.ok());
  EXPECT_EQ(package.error().text,
            "the package unpacks to more than 1999 bytes, the most that are allowed; make the app smaller");
  EXPECT_FALSE(std::filesystem::exists(folder_.path("container/A.app")));
}

TEST_F(Package, RejectsExcessiveCompressionRatio) {
  const std::string app = folder_.path("Bomb.app");
  std::filesystem::create_directories(app);
  writeHostFile(app + "/Info.plist", infoPlist("com.a"));
  writeHostFile(app + "/zeros", "");
  std::filesystem::resize_file(app + "/zeros", std::size_t{80} << 20);
  ASSERT_TRUE(device::writePackage({app}, folder_.path("bomb.zip")).ok());
  const auto package = unpack(folder_.path("bomb.zip"), folder_.path("container"), {});
  ASSERT_FALSE(package.ok());
  EXPECT_EQ(package.error().code, static_cast<long>(InstallerFailure::tooLarge));
  EXPECT_EQ(package.error().text,
            "the package unpacks to more than 200 times its size, the most that is allowed; no app does that");
}

TEST_F(Package, StopsWhenCancelled) {
  device::FileDescriptor file(::open(write(appPackage("com.a")).c_str(), O_RDONLY));
  const device::FileDescriptor container(::open(folder_.path().c_str(), O_RDONLY | O_DIRECTORY));
  auto reader = device::PackageReader::open(std::move(file));
  ASSERT_TRUE(reader.ok());
  std::vector<double> fractions;
  const auto package = device::unpackPackage(*reader, container.get(), [&](double fraction) {
    fractions.push_back(fraction);
    return fractions.size() < 3;
  });
  ASSERT_FALSE(package.ok());
  EXPECT_EQ(package.error().code, static_cast<long>(InstallerFailure::cancelled));
  EXPECT_EQ(fractions.size(), 3U);
  for (const double fraction : fractions) {
    EXPECT_GE(fraction, 0);
    EXPECT_LE(fraction, 1);
  }
}

TEST_F(Package, RejectsFolder) {
  const auto info = device::readPackageInfo(folder_.path());
  ASSERT_FALSE(info.ok());
  EXPECT_EQ(info.error().text, folder_.path() + ": this is not a package; a package is a file");
}

TEST_F(Package, ReadsDescriptionWithoutUnpacking) {
  const std::string bytes = appPackage("com.a", "3.1", {{"HarvoMetadata.plist", "meta"}, {"HarvoArtwork", "art"}});
  const Result<PackageInfo> info = device::readPackageInfo(write(bytes));
  ASSERT_TRUE(info.ok()) << info.error().text;
  EXPECT_EQ(info->identifier, "com.a");
  EXPECT_EQ(info->version, "3.1");
  EXPECT_EQ(info->name, "Notes");
  EXPECT_EQ(textOf(info->storeMetadata.value_or(Bytes())), "meta");
  EXPECT_EQ(textOf(info->artwork.value_or(Bytes())), "art");
  EXPECT_EQ(textOf(info->icon.value_or(Bytes())), "a picture");
  EXPECT_EQ(info->packageBytes, bytes.size());
  EXPECT_NE(info->info.find(platform::kBundleIconFileKey), nullptr);
}

TEST_F(Package, OptionalFilesMayBeMissing) {
  const auto info = device::readPackageInfo(
      write(zipArchive({{"Plain.app/Info.plist", "{ BundleIdentifier = \"com.a\"; BundleIconFile = missing; }"}})));
  ASSERT_TRUE(info.ok()) << info.error().text;
  EXPECT_EQ(info->name, "Plain");
  EXPECT_FALSE(info->version || info->storeMetadata || info->artwork || info->icon);
}

TEST_F(Package, NamesMissingFile) {
  const auto info = device::readPackageInfo(folder_.path("missing.zip"));
  ASSERT_FALSE(info.ok());
  EXPECT_EQ(info.error(), Error::fromErrno(ENOENT).in(folder_.path("missing.zip")));
}

}  // namespace appsync::test
