#include "host/AppOutcome.h"

namespace appsync::host {

std::string_view wordFor(AppEvent event) {
  switch (event) {
    case AppEvent::installed:
      return "installed";
    case AppEvent::updated:
      return "updated";
    case AppEvent::removed:
      return "removed";
    case AppEvent::restored:
      return "restored";
    case AppEvent::failed:
    case AppEvent::cutOff:
      return "failed";
    case AppEvent::skipped:
    case AppEvent::unchanged:
      break;
  }
  return "skipped";
}

}  // namespace appsync::host
