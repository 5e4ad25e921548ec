// Dates as the XML form writes them, and the calendar behind them.
#pragma once

#include <optional>
#include <string>
#include <string_view>

#include "plist/Value.h"

namespace appsync::plist {

/// Whether the moment lies in the years 1 to 9999, the only ones that documents hold.
[[nodiscard]] bool isInCalendar(Date date) noexcept;

/// "2001-01-01T00:00:00Z", with fractions of a second cut off. Only for a moment in the calendar.
void appendDate(std::string& out, Date date);

/// The inverse. None for another layout or a day or time that does not exist.
[[nodiscard]] std::optional<Date> parseDate(std::string_view text) noexcept;

}  // namespace appsync::plist
