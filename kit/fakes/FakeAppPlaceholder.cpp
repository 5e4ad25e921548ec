#include "kit/fakes/FakeInstallCoordinator.h"

namespace appsync::test {

using platform::ClientIdentity;

template <class Change>
Status FakeAppPlaceholder::configure(std::string_view operation, std::string_view arguments, const Change& change) {
  if (auto failure = state_->begin(operation, placeholder_->identifier, arguments)) return *std::move(failure);
  return state_->change([&]() -> Status {
    if (placeholder_->cancellation) return coordinationError("the placeholder was cancelled");
    if (placeholder_->isConfigured) return coordinationError("the placeholder's configuration is complete");
    return change();
  });
}

Status FakeAppPlaceholder::setIconPromise(std::shared_ptr<platform::PromisedTransferToPath> promise) {
  return configure("placeholder.setIconPromise", promise ? promise->name() : "none",
                   [&] { return attach(placeholder_->icon, promise.get()); });
}

Status FakeAppPlaceholder::setPlaceholderAttributes(const platform::PlaceholderAttributes& attributes) {
  return configure("placeholder.setPlaceholderAttributes", {}, [&] {
    placeholder_->attributes = attributes;
    return Status();
  });
}

Status FakeAppPlaceholder::setMetadata(const std::optional<platform::StoreMetadata>& metadata) {
  return configure("placeholder.setMetadata", metadata ? "" : "none", [&] {
    placeholder_->metadata = metadata;
    return Status();
  });
}

Status FakeAppPlaceholder::setSinfData(ByteView licence) {
  return configure("placeholder.setSinfData", {}, [&] {
    placeholder_->sinfData.emplace(licence.begin(), licence.end());
    return Status();
  });
}

Status FakeAppPlaceholder::setConfigurationComplete() {
  return configure("placeholder.setConfigurationComplete", {}, [&] {
    placeholder_->isConfigured = true;
    return Status();
  });
}

Status FakeAppPlaceholder::cancelForReason(const Error& reason, ClientIdentity client) {
  if (auto failure = state_->begin("placeholder.cancelForReason", placeholder_->identifier, textOf(reason, client))) {
    return *std::move(failure);
  }
  return state_->change([&]() -> Status {
    if (placeholder_->isAttached) return coordinationError("the placeholder is a coordinator's");
    if (placeholder_->cancellation) return coordinationError("the placeholder was cancelled");
    if (client != placeholder_->client) return coordinationError("the placeholder is another client's");
    placeholder_->cancellation = FakeCancellation{reason, client};
    if (placeholder_->icon && !placeholder_->icon->cancellation) {
      placeholder_->icon->cancellation = placeholder_->cancellation;
    }
    return {};
  });
}

}  // namespace appsync::test
