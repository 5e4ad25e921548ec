#include "device/apps/InstallRequest.h"

#include "device/packages/BundleIdentifier.h"
#include "device/packages/InstallerError.h"
#include "plist/Access.h"

namespace appsync::device {

namespace {

Error badOption(std::string_view key, std::string_view advice) {
  return installerError(InstallerFailure::badOptions,
                        "the install option \"" + std::string(key) + "\" " + std::string(advice));
}

Result<std::optional<Bytes>> bytesUnder(const plist::Dictionary& options, std::string_view key) {
  const plist::Value* value = options.find(key);
  if (value == nullptr || value->isNull()) return std::optional<Bytes>();
  const std::optional<ByteView> data = value->data();
  if (!data) return badOption(key, "must be data");
  return std::optional(Bytes(data->begin(), data->end()));
}

}  // namespace

Result<InstallRequest> readInstallOptions(const plist::Dictionary& options) {
  InstallRequest request;
  const auto typeName = stringIn(options.find(platform::PackageTypeKey));
  if (typeName != platform::kPackageTypeCustomer && typeName != platform::PackageTypePlaceholder) {
    return badOption(platform::PackageTypeKey, "must be \"Customer\" or \"Placeholder\"");
  }
  request.role = typeName == platform::kPackageTypeCustomer ? BundleRole::installed : BundleRole::placeholder;

  const auto identifier = stringIn(options.find(platform::BundleIdentifierKey));
  if (!identifier) return badOption(platform::BundleIdentifierKey, "must name the app");
  if (!isBundleIdentifier(*identifier)) {
    return installerError(InstallerFailure::badIdentifier,
                          "\"" + std::string(*identifier) +
                              "\" is not a bundle identifier: it may have only letters, "
                              "digits, '-', '.' and '_', at most 200 and no dot first");
  }
  request.identifier = *identifier;

  if (const plist::Value* installType = options.find(platform::kInstallTypeKey)) {
    const auto number = installType->uint64();
    if (!number) return badOption(platform::kInstallTypeKey, "must be a number");
    request.installType = static_cast<platform::TSInstallType>(*number);
  }
  Result<std::optional<Bytes>> metadata = bytesUnder(options, platform::kStoreMetadataKey);
  if (!metadata) return metadata.error();
  request.storeMetadata = std::move(metadata).value();
  Result<std::optional<Bytes>> licence = bytesUnder(options, platform::kLicenceDataKey);
  if (!licence) return licence.error();
  request.licenceData = std::move(licence).value();
  return request;
}

}  // namespace appsync::device
