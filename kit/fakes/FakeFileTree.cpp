#include "kit/fakes/FakeFileTree.h"

#include <cerrno>
#include <deque>
#include <utility>

namespace appsync::test {

namespace {

constexpr int kMostLinks = 40;
constexpr std::size_t kLongestName = 255;

std::deque<std::string> componentsOf(std::string_view path) {
  std::deque<std::string> components;
  while (!path.empty()) {
    const std::size_t end = std::min(path.find('/'), path.size());
    if (end != 0) components.emplace_back(path.substr(0, end));
    path.remove_prefix(std::min(end + 1, path.size()));
  }
  return components;
}

/// Returns 0, or the error number of an invalid path.
int faultOf(std::string_view path) {
  if (path.empty()) return ENOENT;
  return path.front() == '/' && path.find('\0') == std::string_view::npos ? 0 : EINVAL;
}

/// Resolves one path, from the root.
class Walk {
 public:
  Walk(FileNode& root, std::string_view path, LastLink lastLink)
      : lastLink_(lastLink), rest_(componentsOf(path)), folders_{&root} {}

  /// Returns 0 or an error number.
  int run() {
    while (!rest_.empty()) {
      if (const int error = step()) return error;
    }
    return 0;
  }

  FakeFileTree::Place place() && {
    if (name_.empty()) return {nullptr, {}, folders_.back()};
    return {folders_.back(), std::move(name_), node_};
  }

 private:
  int step() {
    FileNode& folder = *folders_.back();
    std::string name = std::move(rest_.front());
    rest_.pop_front();
    if (folder.kind != FileKind::folder) return ENOTDIR;
    if (name == ".") return 0;
    if (name == "..") return leave();
    if (name.size() > kLongestName) return ENAMETOOLONG;
    const auto child = folder.children.find(name);
    if (child == folder.children.end()) return rest_.empty() ? end(std::move(name), nullptr) : ENOENT;
    FileNode& node = *child->second;
    if (node.kind == FileKind::link && (!rest_.empty() || lastLink_ == LastLink::followed)) return follow(node.target);
    if (rest_.empty()) return end(std::move(name), &node);
    folders_.push_back(&node);
    return 0;
  }

  int end(std::string name, FileNode* node) {
    name_ = std::move(name);
    node_ = node;
    return 0;
  }

  int leave() {
    if (folders_.size() == 1) return EXDEV;
    folders_.pop_back();
    return 0;
  }

  int follow(const std::string& target) {
    if (++links_ > kMostLinks) return ELOOP;
    if (target.starts_with('/')) folders_.resize(1);
    const std::deque<std::string> components = componentsOf(target);
    rest_.insert(rest_.begin(), components.begin(), components.end());
    return 0;
  }

  LastLink lastLink_;
  std::deque<std::string> rest_;
  std::vector<FileNode*> folders_;
  int links_ = 0;
  std::string name_;
  FileNode* node_ = nullptr;
};

void appendPaths(std::vector<std::string>& paths, const std::string& folder, const FileNode& node) {
  for (const auto& [name, child] : node.children) {
    const bool isFolder = child->kind == FileKind::folder;
    std::string path = folder + "/" + name;
    paths.push_back(isFolder ? path + "/" : path);
    if (isFolder) appendPaths(paths, path, *child);
  }
}

}  // namespace

std::unique_ptr<FileNode> FileNode::clone() const {
  auto copy = std::make_unique<FileNode>();
  copy->kind = kind;
  copy->bytes = bytes;
  copy->target = target;
  copy->owners = owners;
  for (const auto& [name, child] : children)
    copy->children.emplace(name, child->clone());
  return copy;
}

FakeFileTree::FakeFileTree() {
  root_.kind = FileKind::folder;
}

Result<FakeFileTree::Place> FakeFileTree::find(std::string_view path, LastLink lastLink) {
  if (const int fault = faultOf(path)) return Error::fromErrno(fault, path);
  Walk walk(root_, path, lastLink);
  if (const int error = walk.run()) return Error::fromErrno(error, path);
  return std::move(walk).place();
}

Result<FakeFileTree::Place> FakeFileTree::findExisting(std::string_view path, LastLink lastLink) {
  Result<Place> place = find(path, lastLink);
  if (place && place->node == nullptr) return Error::fromErrno(ENOENT, path);
  return place;
}

Result<FakeFileTree::Place> FakeFileTree::findFree(std::string_view path) {
  Result<Place> place = find(path, LastLink::itself);
  if (place && place->node != nullptr) return Error::fromErrno(EEXIST, path);
  return place;
}

Status FakeFileTree::makeFolders(std::string_view path, const platform::OwnerAttributes& owners) {
  Result<Place> place = find(path, LastLink::followed);
  if (!place && place.error().code == ENOENT && path.size() > 1) {
    const std::string_view parent = path.substr(0, std::max<std::size_t>(path.find_last_of('/'), 1));
    if (Status made = makeFolders(parent, owners); !made) return made;
    place = find(path, LastLink::followed);
  }
  if (!place) return place.error();
  if (place->node == nullptr) {
    put(*place, makeFolder(owners));
  } else if (place->node->kind != FileKind::folder) {
    return Error::fromErrno(EEXIST, path);
  }
  return {};
}

FileNode& FakeFileTree::put(const Place& place, std::unique_ptr<FileNode> node) {
  std::unique_ptr<FileNode>& slot = place.parent->children[place.name];
  slot = std::move(node);
  return *slot;
}

std::vector<std::string> FakeFileTree::paths(std::string_view folder) {
  std::vector<std::string> paths;
  const Result<Place> place = findExisting(folder, LastLink::followed);
  if (place) appendPaths(paths, folder == "/" ? std::string() : std::string(folder), *place->node);
  return paths;
}

std::unique_ptr<FileNode> makeFile(ByteView bytes, const platform::OwnerAttributes& owners) {
  auto node = std::make_unique<FileNode>();
  node->bytes.assign(bytes.begin(), bytes.end());
  node->owners = owners;
  return node;
}

std::unique_ptr<FileNode> makeFolder(const platform::OwnerAttributes& owners) {
  auto node = std::make_unique<FileNode>();
  node->kind = FileKind::folder;
  node->owners = owners;
  return node;
}

std::unique_ptr<FileNode> makeLink(std::string_view target) {
  auto node = std::make_unique<FileNode>();
  node->kind = FileKind::link;
  node->target = target;
  return node;
}

}  // namespace appsync::test
