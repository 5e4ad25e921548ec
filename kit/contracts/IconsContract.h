// Holds icon renderers and PNG encoders to platform/IconRenderer.h.
#pragma once

#include <memory>

#include "kit/contracts/Contract.h"
#include "platform/Bundle.h"
#include "platform/IconRenderer.h"

namespace appsync::test {

/// What an app's icon is like.
enum class IconKind { usable, damaged, missingFile, notNamed };

class IconsSubject {
 public:
  virtual ~IconsSubject() = default;

  [[nodiscard]] virtual platform::IconRenderer& renderer() = 0;
  [[nodiscard]] virtual platform::PNGEncoders& encoders() = 0;
  /// A new app's bundle.
  [[nodiscard]] virtual std::unique_ptr<platform::Bundle> makeApp(IconKind icon) = 0;
};

class IconsContract : public Contract<IconsSubject> {
 protected:
  [[nodiscard]] std::unique_ptr<platform::Image> iconOf(IconKind kind) {
    return subject().renderer().createHomeScreenIconImage(*subject().makeApp(kind));
  }
};

}  // namespace appsync::test
