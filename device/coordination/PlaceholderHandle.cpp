#include "device/coordination/PlaceholderHandle.h"

#include "device/coordination/Coordinators.h"
#include "device/coordination/PromiseHandles.h"
#include "plist/PropertyList.h"

namespace appsync::device {

std::shared_ptr<PlaceholderState> stateOf(const Coordinators& coordinators,
                                          const std::shared_ptr<platform::Placeholder>& placeholder) {
  const auto* own = dynamic_cast<const PlaceholderHandle*>(placeholder.get());
  return own == nullptr ? nullptr : own->stateIn(coordinators);
}

Status PlaceholderHandle::setIconPromise(std::shared_ptr<platform::PromisedTransferToPath> promise) {
  const auto icon = stateOf(*coordinators_, promise);
  return coordinators_->configure(state_, [&](PlaceholderState& copy) -> Status {
    const bool isUsable =
        icon != nullptr && !icon->role && icon->stage != PromiseStage::withdrawn && copy.icon == nullptr;
    if (!isUsable) return coordinationError(CoordinationFailure::notUsable, "this is not an icon for the placeholder");
    copy.icon = icon;
    return {};
  });
}

Status PlaceholderHandle::setPlaceholderAttributes(const platform::PlaceholderAttributes& attributes) {
  Result<Bytes> document = plist::writeBinary(attributes.infoDictionary());
  if (!document) return document.error().in("the placeholder's info dictionary");
  return coordinators_->configure(state_, [&](PlaceholderState& copy) -> Status {
    copy.attributes = attributes;
    copy.infoDocument = std::move(document).value();
    return {};
  });
}

Status PlaceholderHandle::setMetadata(const std::optional<platform::StoreMetadata>& metadata) {
  std::optional<Bytes> kept;
  if (metadata) {
    Result<Bytes> document = plist::writeBinary(metadata->dictionary());
    if (!document) return document.error().in("the store metadata");
    kept = std::move(document).value();
  }
  return coordinators_->configure(state_, [&](PlaceholderState& copy) -> Status {
    copy.storeMetadata = std::move(kept);
    return {};
  });
}

Status PlaceholderHandle::setSinfData(ByteView licence) {
  return coordinators_->configure(state_, [&](PlaceholderState& copy) -> Status {
    copy.licence = Bytes(licence.begin(), licence.end());
    return {};
  });
}

Status PlaceholderHandle::setConfigurationComplete() {
  return coordinators_->configure(state_, [](PlaceholderState& copy) -> Status {
    copy.isConfigured = true;
    return {};
  });
}

Status PlaceholderHandle::cancelForReason(const Error&, platform::ClientIdentity client) {
  return coordinators_->withdraw(state_, client);
}

}  // namespace appsync::device
