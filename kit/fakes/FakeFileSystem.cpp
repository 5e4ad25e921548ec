#include "kit/fakes/FakeFileSystem.h"

#include <array>
#include <cerrno>
#include <memory>
#include <utility>

#include "kit/fakes/CallJournal.h"

namespace appsync::test {

namespace {

std::string nameOf(FileOperation operation) {
  constexpr std::array<std::string_view, 10> kNames{
      "fileExists",      "attributesOfItem", "readFile", "writeFileAtomically", "createFile",
      "createDirectory", "copyItem",         "moveItem", "removeItem",          "touch"};
  return "fileSystem." + std::string(kNames.at(static_cast<std::size_t>(operation)));
}

std::string parentOf(std::string_view path) {
  const std::size_t slash = path.find_last_of('/');
  return slash == 0 || slash == std::string_view::npos ? "/" : std::string(path.substr(0, slash));
}

bool holds(const FileNode& node, const FileNode* sought) {
  if (&node == sought) return true;
  for (const auto& [name, child] : node.children) {
    if (holds(*child, sought)) return true;
  }
  return false;
}

}  // namespace

FakeFileSystem::FakeFileSystem(CallJournal& journal) : journal_(journal) {
  putFolder("/tmp");
}

void FakeFileSystem::put(std::string_view path, ByteView bytes) {
  putFolder(parentOf(path));
  const std::scoped_lock lock(mutex_);
  const Result<FakeFileTree::Place> place = tree_.find(path, LastLink::followed);
  const bool isTaken = place && place->node != nullptr && place->node->kind == FileKind::folder;
  if (!place || isTaken) return misuse("no file can be put at " + std::string(path));
  FakeFileTree::put(*place, makeFile(bytes, {}));
}

void FakeFileSystem::putFolder(std::string_view path) {
  const std::scoped_lock lock(mutex_);
  if (!tree_.makeFolders(path, {})) misuse("no folder can be put at " + std::string(path));
}

void FakeFileSystem::putLink(std::string_view path, std::string_view target) {
  putFolder(parentOf(path));
  const std::scoped_lock lock(mutex_);
  const Result<FakeFileTree::Place> place = tree_.findFree(path);
  if (!place) return misuse("no link can be put at " + std::string(path));
  FakeFileTree::put(*place, makeLink(target));
}

void FakeFileSystem::erase(std::string_view path) {
  const std::scoped_lock lock(mutex_);
  const Result<FakeFileTree::Place> place = tree_.findExisting(path, LastLink::itself);
  if (place && place->parent != nullptr) place->parent->children.erase(place->name);
}

bool FakeFileSystem::has(std::string_view path) {
  const std::scoped_lock lock(mutex_);
  return tree_.findExisting(path, LastLink::followed).ok();
}

bool FakeFileSystem::hasFolder(std::string_view path) {
  const std::scoped_lock lock(mutex_);
  const Result<FakeFileTree::Place> place = tree_.findExisting(path, LastLink::followed);
  return place && place->node->kind == FileKind::folder;
}

std::optional<Bytes> FakeFileSystem::contents(std::string_view path) {
  const std::scoped_lock lock(mutex_);
  const Result<FakeFileTree::Place> place = tree_.findExisting(path, LastLink::followed);
  if (!place || place->node->kind != FileKind::file) return std::nullopt;
  return place->node->bytes;
}

std::optional<std::string> FakeFileSystem::text(std::string_view path) {
  const std::optional<Bytes> bytes = contents(path);
  if (!bytes) return std::nullopt;
  return std::string(textOf(*bytes));
}

std::optional<platform::OwnerAttributes> FakeFileSystem::owners(std::string_view path) {
  const std::scoped_lock lock(mutex_);
  const Result<FakeFileTree::Place> place = tree_.findExisting(path, LastLink::followed);
  if (!place) return std::nullopt;
  return place->node->owners;
}

std::size_t FakeFileSystem::touches(std::string_view path) {
  const std::scoped_lock lock(mutex_);
  const Result<FakeFileTree::Place> place = tree_.findExisting(path, LastLink::followed);
  return place ? place->node->touches : 0;
}

std::size_t FakeFileSystem::writes(std::string_view path) const {
  const std::scoped_lock lock(mutex_);
  const auto found = writes_.find(path);
  return found == writes_.end() ? 0 : found->second;
}

std::vector<std::string> FakeFileSystem::paths(std::string_view folder) {
  const std::scoped_lock lock(mutex_);
  return tree_.paths(folder);
}

std::optional<Error> FakeFileSystem::begin(FileOperation operation, std::string_view path, std::string_view otherPath) {
  std::string arguments(path);
  if (!otherPath.empty()) arguments.append(" ").append(otherPath);
  if (std::optional<Error> failure = journal_.beforeCall(nameOf(operation), arguments)) return failure;
  if (std::optional<Error> failure = failures.take(operation, path)) return failure;
  return otherPath.empty() ? std::nullopt : failures.take(operation, otherPath);
}

bool FakeFileSystem::fileExists(std::string_view path) {
  if (begin(FileOperation::fileExists, path)) return false;
  return has(path);
}

Result<platform::FileAttributes> FakeFileSystem::attributesOfItem(std::string_view path) {
  if (auto failure = begin(FileOperation::attributesOfItem, path)) return *std::move(failure);
  const std::scoped_lock lock(mutex_);
  const Result<FakeFileTree::Place> place = tree_.findExisting(path, LastLink::followed);
  if (!place) return place.error();
  return platform::FileAttributes{place->node->bytes.size(), place->node->kind == FileKind::folder};
}

Result<Bytes> FakeFileSystem::readFile(std::string_view path) {
  if (auto failure = begin(FileOperation::readFile, path)) return *std::move(failure);
  const std::scoped_lock lock(mutex_);
  const Result<FakeFileTree::Place> place = tree_.findExisting(path, LastLink::followed);
  if (!place) return place.error();
  if (place->node->kind == FileKind::folder) return Error::fromErrno(EISDIR, path);
  return place->node->bytes;
}

Status FakeFileSystem::writeFileAtomically(std::string_view path, ByteView bytes) {
  if (auto failure = begin(FileOperation::writeFileAtomically, path)) return *std::move(failure);
  return replaceFile(path, bytes, {});
}

Status FakeFileSystem::createFile(std::string_view path, ByteView bytes, const platform::OwnerAttributes& attributes) {
  if (auto failure = begin(FileOperation::createFile, path)) return *std::move(failure);
  return replaceFile(path, bytes, attributes);
}

Status FakeFileSystem::replaceFile(std::string_view path, ByteView bytes, const platform::OwnerAttributes& owners) {
  const std::scoped_lock lock(mutex_);
  const Result<FakeFileTree::Place> place = tree_.find(path, LastLink::itself);
  if (!place) return place.error();
  if (place->node != nullptr && place->node->kind == FileKind::folder) return Error::fromErrno(EISDIR, path);
  FakeFileTree::put(*place, makeFile(bytes, owners));
  ++writes_[std::string(path)];
  return {};
}

Status FakeFileSystem::createDirectory(std::string_view path, platform::IntermediateDirectories intermediates,
                                       const platform::OwnerAttributes& attributes) {
  if (auto failure = begin(FileOperation::createDirectory, path)) return *std::move(failure);
  const std::scoped_lock lock(mutex_);
  if (intermediates == platform::IntermediateDirectories::create) return tree_.makeFolders(path, attributes);
  const Result<FakeFileTree::Place> place = tree_.findFree(path);
  if (!place) return place.error();
  FakeFileTree::put(*place, makeFolder(attributes));
  return {};
}

Status FakeFileSystem::copyItem(std::string_view from, std::string_view to) {
  if (auto failure = begin(FileOperation::copyItem, from, to)) return *std::move(failure);
  const std::scoped_lock lock(mutex_);
  const Result<FakeFileTree::Place> source = tree_.findExisting(from, LastLink::itself);
  if (!source) return source.error();
  const Result<FakeFileTree::Place> destination = tree_.findFree(to);
  if (!destination) return destination.error();
  if (holds(*source->node, destination->parent)) return Error::fromErrno(EINVAL, to);
  FakeFileTree::put(*destination, source->node->clone());
  return {};
}

Status FakeFileSystem::moveItem(std::string_view from, std::string_view to) {
  if (auto failure = begin(FileOperation::moveItem, from, to)) return *std::move(failure);
  const std::scoped_lock lock(mutex_);
  const Result<FakeFileTree::Place> source = tree_.findExisting(from, LastLink::itself);
  if (!source) return source.error();
  const Result<FakeFileTree::Place> destination = tree_.findFree(to);
  if (!destination) return destination.error();
  if (source->parent == nullptr || holds(*source->node, destination->parent)) return Error::fromErrno(EINVAL, to);
  auto taken = source->parent->children.extract(source->name);
  FakeFileTree::put(*destination, std::move(taken.mapped()));
  return {};
}

Status FakeFileSystem::removeItem(std::string_view path) {
  if (auto failure = begin(FileOperation::removeItem, path)) return *std::move(failure);
  const std::scoped_lock lock(mutex_);
  const Result<FakeFileTree::Place> place = tree_.findExisting(path, LastLink::itself);
  if (!place) return place.error();
  if (place->parent == nullptr) return Error::fromErrno(EBUSY, path);
  place->parent->children.erase(place->name);
  return {};
}

Status FakeFileSystem::touch(std::string_view path) {
  if (auto failure = begin(FileOperation::touch, path)) return *std::move(failure);
  const std::scoped_lock lock(mutex_);
  const Result<FakeFileTree::Place> place = tree_.findExisting(path, LastLink::followed);
  if (!place) return Error::fromErrno(static_cast<int>(place.error().code));
  ++place->node->touches;
  return {};
}

std::string FakeFileSystem::temporaryDirectory() {
  static_cast<void>(journal_.beforeCall("fileSystem.temporaryDirectory"));
  return "/tmp";
}

}  // namespace appsync::test
