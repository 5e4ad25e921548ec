#include "plist/DictionaryStream.h"

#include <utility>

#include "plist/internal/BinaryReader.h"

namespace appsync::plist {

DictionaryStream::DictionaryStream() = default;
DictionaryStream::DictionaryStream(DictionaryStream&&) noexcept = default;
DictionaryStream& DictionaryStream::operator=(DictionaryStream&&) noexcept = default;
DictionaryStream::~DictionaryStream() = default;

Result<DictionaryStream> DictionaryStream::open(Bytes&& document) {
  const auto kept = std::make_shared<const Bytes>(std::move(document));
  DictionaryStream entries;
  entries.reader_ = std::make_unique<BinaryReader>(kept);
  if (entries.reader_->beginEntries()) {
    Result<std::vector<std::size_t>> places = entries.reader_->checkEntries();
    if (!places) return places.error();
    entries.places_ = std::move(places).value();
    return entries;
  }
  entries.reader_.reset();
  Result<Value> root = read(ByteView(*kept));
  if (!root) return root.error();
  Dictionary* dictionary = root->dictionary();
  if (dictionary == nullptr) return rootIsNoDictionary();
  entries.dictionary_ = std::move(*dictionary);
  return entries;
}

void DictionaryStream::visit(const Visit& visit) {
  for (const auto& [key, value] : dictionary_)
    visit(key, value);
  if (reader_) reader_->startAgain();
  for (const std::size_t place : places_) {
    const Value key = reader_->entryKey(place);
    visit(*key.string(), reader_->entryValue(place));
  }
}

}  // namespace appsync::plist
