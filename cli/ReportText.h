// The texts of a sync's report.
#pragma once

#include <string>
#include <string_view>

#include "host/AppOutcome.h"

namespace appsync::cli {

/// Returns "Tides 1.2", with the identifier if the name is unknown. Printable.
[[nodiscard]] std::string shownName(const host::AppName& app);

/// Returns "installed  Tides 1.2", or an empty string for outcomes without a line. For failures see `failureSentence`.
[[nodiscard]] std::string outcomeLine(const host::AppOutcome& outcome);

/// Returns "Tides 1.2 (org.example.tides) failed: its package is damaged".
[[nodiscard]] std::string failureSentence(const host::AppOutcome& outcome);

/// Returns "waiting    Tides 1.2: the home screen ...".
[[nodiscard]] std::string waitingLine(const host::AppName& app, std::string_view reason);

/// Returns "2 installed, 1 failed, 5 up to date.", or "Nothing to do.".
[[nodiscard]] std::string summaryLine(const host::AppOutcomes& outcomes);

}  // namespace appsync::cli
