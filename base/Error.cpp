#include "base/Error.h"

#include <cstddef>
#include <string>
#include <system_error>
#include <utility>

namespace appsync {

Error Error::in(std::string_view context) const {
  Error wider = *this;
  wider.text.insert(0, ": ").insert(0, context);
  return wider;
}

Error Error::fromErrno(int number, std::string_view context) {
  Error error{std::string(domains::kPOSIX), number, std::generic_category().message(number), nullptr};
  return context.empty() ? error : error.in(context);
}

void appendDescription(std::string& out, const Error& error) {
  std::size_t depth = 0;
  for (const Error* next = &error; next != nullptr; next = next->underlying.get(), ++depth) {
    if (depth > 0) out += " {";
    out.append(next->domain)
        .append(" ")
        .append(std::to_string(next->code))
        .append(" \"")
        .append(next->text)
        .append("\"");
  }
  out.append(depth - 1, '}');
}

}  // namespace appsync
