// Values of store metadata, of the types that they should have.
#pragma once

#include <string_view>

#include "common/PlugInLog.h"
#include "plist/PropertyList.h"

namespace appsync {

/// A number is an integer or a real; a truth value is none.
enum class ExpectedType { string, number, dictionary };

/// `value`, if it is of that type. Else null: for a null, which stands for a missing value, without a word, and for a
/// value of another type with an error that names `label`.
[[nodiscard]] const plist::Value* typedLookup(const plist::Value* value, ExpectedType type, std::string_view label,
                                              const PlugInLog& log);

}  // namespace appsync
