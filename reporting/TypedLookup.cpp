#include "reporting/TypedLookup.h"

namespace appsync {

namespace {

bool isOfType(const plist::Value& value, ExpectedType type) {
  switch (type) {
    case ExpectedType::string:
      return value.type() == plist::Type::string;
    case ExpectedType::number:
      return value.type() == plist::Type::integer || value.type() == plist::Type::real;
    case ExpectedType::dictionary:
      return value.type() == plist::Type::dictionary;
  }
  return false;
}

}  // namespace

const plist::Value* typedLookup(const plist::Value* value, ExpectedType type, std::string_view label,
                                const PlugInLog& log) {
  if (value == nullptr || isOfType(*value, type)) return value;
  log.lookupError("unexpected type for %{public}@", label);
  return nullptr;
}

}  // namespace appsync
