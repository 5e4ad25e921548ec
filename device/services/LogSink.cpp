#include "device/services/LogSink.h"

#include <cerrno>

#include <fcntl.h>

#include "base/TimeText.h"
#include "base/UTF8.h"
#include "device/storage/HostFile.h"

namespace appsync::device {

namespace {

void appendEscaped(std::string& line, char letter) {
  constexpr std::string_view kDigits = "0123456789abcdef";
  const auto code = static_cast<unsigned char>(letter);
  if (letter == '\n') {
    line += "\\n";
  } else if (letter == '\\') {
    line += "\\\\";
  } else {
    line += {'\\', 'x', kDigits[code >> 4U], kDigits[code & 15U]};
  }
}

void appendMessage(std::string& line, std::string_view message) {
  while (!message.empty()) {
    const Character character = firstCharacter(message);
    const std::string_view bytes = message.substr(0, character.length);
    if (character.valid && !isUnsafeForDisplay(character.code) && character.code != '\\') {
      line += bytes;
    } else {
      for (const char byte : bytes)
        appendEscaped(line, byte);
    }
    message.remove_prefix(character.length);
  }
}

}  // namespace

Result<std::unique_ptr<FileLogSink>> FileLogSink::open(const std::string& hostPath) {
  // A pipe would wait for its reader; once there is one it is written to like a file.
  FileDescriptor file(
      ::open(hostPath.c_str(), O_WRONLY | O_APPEND | O_CREAT | O_NONBLOCK | O_NOCTTY | O_CLOEXEC, 0644));
  if (!file.valid() && errno == ENXIO) {
    return Error{std::string(domains::kPOSIX), ENXIO,
                 "cannot open log file \"" + hostPath + "\": nobody reads from this pipe; start its reader first",
                 nullptr};
  }
  if (!file.valid() || ::fcntl(file.get(), F_SETFL, O_APPEND) != 0) {
    return Error::fromErrno(errno, "cannot open log file \"" + hostPath + "\"");
  }
  return std::unique_ptr<FileLogSink>(new FileLogSink(std::move(file)));
}

void FileLogSink::write(std::chrono::system_clock::time_point time, int category, LogLevel level,
                        std::string_view message) {
  std::string line;
  line.reserve(message.size() + 48);
  appendTime(line, std::chrono::floor<std::chrono::microseconds>(time));
  line += ' ';
  line += std::to_string(category);
  line += level == LogLevel::error ? " error " : " default ";
  appendMessage(line, message);
  line += '\n';
  static_cast<void>(writeAll(file_.get(), bytesOf(line)));
}

}  // namespace appsync::device
