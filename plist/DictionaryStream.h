// Documents of many entries, without all of them in memory at once.
#pragma once

#include <cstddef>
#include <functional>
#include <memory>
#include <string_view>
#include <vector>

#include "plist/PropertyList.h"

namespace appsync::plist {

class BinaryReader;

/// A document whose root is a dictionary. Of the binary form it keeps the document and a number for each entry, and
/// what it hands out is read anew and dropped; the other forms are read as a whole.
class DocumentEntries {
 public:
  /// A value that is kept keeps the document.
  using Visit = std::function<void(std::string_view key, const Value& value)>;

  /// Reads everything once, to be sure that it can be read: fails where `read` does, or when the root is no dictionary.
  /// (How far a hostile document may unfold is counted for each entry anew.)
  [[nodiscard]] static Result<DocumentEntries> open(Bytes&& document);

  DocumentEntries(DocumentEntries&&) noexcept;
  DocumentEntries& operator=(DocumentEntries&&) noexcept;
  ~DocumentEntries();

  /// Hands out every entry in the order of a dictionary's keys; of equal keys the last one counts.
  void visit(const Visit& visit);

 private:
  DocumentEntries();

  /// Null when the whole is in `dictionary_`.
  std::unique_ptr<BinaryReader> reader_;
  std::vector<std::size_t> places_;
  Dictionary dictionary_;
};

}  // namespace appsync::plist
