// The sentences in which people are told how a sync went.
#pragma once

#include <string>
#include <string_view>

#include "tools/AppOutcome.h"

namespace appsync::tools {

/// "Tides 1.2", or the identifier when there is no name. Printable.
[[nodiscard]] std::string shownName(const AppName& app);

/// "installed  Tides 1.2"; empty for what is not worth a line. Failures are errors, see `failureSentence`.
[[nodiscard]] std::string outcomeLine(const AppOutcome& outcome);

/// "Tides 1.2 (org.example.tides) failed: its package is damaged".
[[nodiscard]] std::string failureSentence(const AppOutcome& outcome);

/// "waiting    Tides 1.2: the home screen ...".
[[nodiscard]] std::string waitingLine(const AppName& app, std::string_view reason);

/// "2 installed, 1 failed, 5 up to date.", or that there was nothing to do.
[[nodiscard]] std::string summaryLine(const AppOutcomes& outcomes);

}  // namespace appsync::tools
