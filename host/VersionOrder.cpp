#include "host/VersionOrder.h"

#include <algorithm>

namespace appsync::host {
namespace {

/// Removes the text before the next '.' from `rest` and returns it.
std::string_view takeComponent(std::string_view& rest) {
  const std::size_t end = std::min(rest.find('.'), rest.size());
  const std::string_view component = rest.substr(0, end);
  rest.remove_prefix(std::min(end + 1, rest.size()));
  return component;
}

/// Removes the leading digits from `component` and returns them without leading zeros.
std::string_view takeNumber(std::string_view& component) {
  const std::size_t end = std::min(component.find_first_not_of("0123456789"), component.size());
  std::string_view digits = component.substr(0, end);
  component.remove_prefix(end);
  digits.remove_prefix(std::min(digits.find_first_not_of('0'), digits.size()));
  return digits;
}

std::weak_ordering compareComponents(std::string_view left, std::string_view right) {
  const std::string_view leftNumber = takeNumber(left);
  const std::string_view rightNumber = takeNumber(right);
  if (const auto order = leftNumber.size() <=> rightNumber.size(); std::is_neq(order)) return order;
  if (const auto order = leftNumber <=> rightNumber; std::is_neq(order)) return order;
  return left <=> right;
}

}  // namespace

std::weak_ordering compareVersions(std::string_view left, std::string_view right) {
  while (!left.empty() || !right.empty()) {
    if (const auto order = compareComponents(takeComponent(left), takeComponent(right)); std::is_neq(order))
      return order;
  }
  return std::weak_ordering::equivalent;
}

}  // namespace appsync::host
