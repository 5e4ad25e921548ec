// The sentences in which people are told how a sync went.
#pragma once

#include <string>
#include <string_view>

#include "host/AppOutcome.h"

namespace appsync::cli {

/// "Tides 1.2", or the identifier when there is no name. Printable.
[[nodiscard]] std::string shownName(const host::AppName& app);

/// "installed  Tides 1.2"; empty for what is not worth a line. Failures are errors, see `failureSentence`.
[[nodiscard]] std::string outcomeLine(const host::AppOutcome& outcome);

/// "Tides 1.2 (org.example.tides) failed: its package is damaged".
[[nodiscard]] std::string failureSentence(const host::AppOutcome& outcome);

/// "waiting    Tides 1.2: the home screen ...".
[[nodiscard]] std::string waitingLine(const host::AppName& app, std::string_view reason);

/// "2 installed, 1 failed, 5 up to date.", or that there was nothing to do.
[[nodiscard]] std::string summaryLine(const host::AppOutcomes& outcomes);

}  // namespace appsync::cli
