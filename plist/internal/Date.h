// Dates in the XML format, and the range of their calendar.
#pragma once

#include <optional>
#include <string>
#include <string_view>

#include "plist/Value.h"

namespace appsync::plist {

/// Whether the date is in the years 1 to 9999, the only ones that documents can represent.
[[nodiscard]] bool isInCalendar(Date date) noexcept;

/// Appends "2001-01-01T00:00:00Z" without fractions of a second. The date must be in the calendar.
void appendDate(std::string& out, Date date);

/// Parses the text of appendDate. Returns nullopt for another layout or a day or time that does not exist.
[[nodiscard]] std::optional<Date> parseDate(std::string_view text) noexcept;

}  // namespace appsync::plist
