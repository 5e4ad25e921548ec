// Large dictionaries, one entry in memory at a time.
#pragma once

#include <cstddef>
#include <functional>
#include <memory>
#include <string_view>
#include <vector>

#include "plist/PropertyList.h"

namespace appsync::plist {

class BinaryReader;

/// A document whose root is a dictionary. For the binary format it keeps the document and one number for each entry,
/// and parses each entry when it is visited; other formats are parsed as a whole.
class DictionaryStream {
 public:
  /// A Value that outlives the callback keeps the whole document in memory.
  using Visit = std::function<void(std::string_view key, const Value& value)>;

  /// Parses the whole document once for validation. Fails where `read` fails (but expansion limits apply to each entry
  /// separately) or if the root is not a dictionary.
  [[nodiscard]] static Result<DictionaryStream> open(Bytes&& document);

  DictionaryStream(DictionaryStream&&) noexcept;
  DictionaryStream& operator=(DictionaryStream&&) noexcept;
  ~DictionaryStream();

  /// Calls `visit` with every entry, in the order of the keys; of equal keys the last one wins.
  void visit(const Visit& visit);

 private:
  DictionaryStream();

  /// Null if the document was parsed as a whole into `dictionary_`.
  std::unique_ptr<BinaryReader> reader_;
  std::vector<std::size_t> places_;
  Dictionary dictionary_;
};

}  // namespace appsync::plist
