// Contract of platform/IconRenderer.h.
#pragma once

#include <memory>

#include "kit/contracts/Contract.h"
#include "platform/Bundle.h"
#include "platform/IconRenderer.h"

namespace appsync::test {

/// The state of an app's icon file.
enum class IconKind { usable, damaged, missingFile, notNamed };

class IconsSubject {
 public:
  virtual ~IconsSubject() = default;

  [[nodiscard]] virtual platform::IconRenderer& renderer() = 0;
  [[nodiscard]] virtual platform::PNGEncoders& encoders() = 0;
  /// Returns the bundle of a new app.
  [[nodiscard]] virtual std::unique_ptr<platform::Bundle> makeApp(IconKind icon) = 0;
};

class IconsContract : public Contract<IconsSubject> {
 protected:
  [[nodiscard]] std::unique_ptr<platform::Image> iconOf(IconKind kind) {
    return subject().renderer().createHomeScreenIconImage(*subject().makeApp(kind));
  }
};

}  // namespace appsync::test
