// From a document's bytes to its text.
#pragma once

#include <string>
#include <string_view>

#include "base/Bytes.h"
#include "base/Error.h"

namespace appsync::plist {

/// The document as UTF-8 without a byte-order mark: a view of the document itself, or of `converted` when it was
/// UTF-16, told by a byte-order mark or by its first two bytes. Refuses what is not well-formed.
[[nodiscard]] Result<std::string_view> decodeText(ByteView document, std::string& converted);

}  // namespace appsync::plist
