#include "device/HostFile.h"

#include <fcntl.h>

#include "device/SystemCalls.h"

namespace appsync::device {

namespace {

int writeAndRename(const std::string& draft, const std::string& path, ByteView bytes) {
  FileDescriptor file;
  if (const int failed = sys::createFile(AT_FDCWD, draft.c_str(), sys::kFileMode, file); failed != 0) return failed;
  int failed = sys::writeAt(file.get(), bytes, 0);
  if (failed == 0) failed = sys::writeOut(file.get());
  if (failed == 0) failed = sys::rename(AT_FDCWD, draft.c_str(), AT_FDCWD, path.c_str(), sys::Replace::yes);
  if (failed != 0) static_cast<void>(sys::removeFile(AT_FDCWD, draft.c_str()));
  return failed;
}

}  // namespace

Status replaceHostFile(const std::string& path, ByteView bytes) {
  const int failed = writeAndRename(path + "." + sys::temporaryName(), path, bytes);
  if (failed != 0) return Error::fromErrno(failed, path + " cannot be written");
  return {};
}

}  // namespace appsync::device
