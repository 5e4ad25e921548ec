#include "plist/internal/Date.h"

#include <array>
#include <chrono>
#include <cmath>

namespace appsync::plist {

namespace {

using std::chrono::day;
using std::chrono::days;
using std::chrono::month;
using std::chrono::seconds;
using std::chrono::sys_days;
using std::chrono::year;
using std::chrono::year_month_day;

constexpr sys_days kEpoch = year(2001) / 1 / 1;
constexpr double kFirst = static_cast<double>(seconds(sys_days(year(1) / 1 / 1) - kEpoch).count());
constexpr double kEnd = static_cast<double>(seconds(sys_days(year(10000) / 1 / 1) - kEpoch).count());

/// A run of digits in the text: 0 stands for any digit in the layout.
constexpr std::string_view kLayout = "0000-00-00T00:00:00Z";

struct Field {
  std::size_t start;
  std::size_t length;
};
constexpr std::array<Field, 6> kFields = {{{0, 4}, {5, 2}, {8, 2}, {11, 2}, {14, 2}, {17, 2}}};

bool fitsLayout(std::string_view text) noexcept {
  if (text.size() != kLayout.size()) return false;
  for (std::size_t i = 0; i < kLayout.size(); ++i) {
    const bool isDigit = text[i] >= '0' && text[i] <= '9';
    if (kLayout[i] == '0' ? !isDigit : text[i] != kLayout[i]) return false;
  }
  return true;
}

unsigned number(std::string_view text, Field field) noexcept {
  unsigned sum = 0;
  for (const char c : text.substr(field.start, field.length))
    sum = sum * 10 + static_cast<unsigned>(c - '0');
  return sum;
}

}  // namespace

bool isInCalendar(Date date) noexcept {
  return date.seconds >= kFirst && date.seconds < kEnd;
}

void appendDate(std::string& out, Date date) {
  const seconds whole(static_cast<std::int64_t>(std::floor(date.seconds)));
  const sys_days today = kEpoch + std::chrono::floor<days>(whole);
  const year_month_day calendar(today);
  const auto rest = static_cast<unsigned>((whole - seconds(today - kEpoch)).count());
  const std::array<unsigned, 6> parts = {static_cast<unsigned>(static_cast<int>(calendar.year())),
                                         static_cast<unsigned>(calendar.month()),
                                         static_cast<unsigned>(calendar.day()),
                                         rest / 3600,
                                         rest / 60 % 60,
                                         rest % 60};
  const std::size_t start = out.size();
  out += kLayout;
  for (std::size_t i = 0; i < parts.size(); ++i) {
    unsigned left = parts[i];
    for (std::size_t digit = kFields[i].length; digit-- > 0; left /= 10) {
      out[start + kFields[i].start + digit] = static_cast<char>('0' + left % 10);
    }
  }
}

std::optional<Date> parseDate(std::string_view text) noexcept {
  if (!fitsLayout(text)) return std::nullopt;
  std::array<unsigned, 6> parts{};
  for (std::size_t i = 0; i < parts.size(); ++i)
    parts[i] = number(text, kFields[i]);
  const auto [years, months, dayOfMonth, hours, minutes, secondsOfMinute] = parts;
  const year_month_day calendar(year(static_cast<int>(years)), month(months), day(dayOfMonth));
  if (years == 0 || !calendar.ok() || hours > 23 || minutes > 59 || secondsOfMinute > 59) return std::nullopt;
  const auto whole = seconds(sys_days(calendar) - kEpoch).count();
  return Date{static_cast<double>(whole + static_cast<long>(hours * 3600 + minutes * 60 + secondsOfMinute))};
}

}  // namespace appsync::plist
