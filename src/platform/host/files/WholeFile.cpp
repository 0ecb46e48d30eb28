#include "platform/host/files/WholeFile.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>

#include "platform/host/files/FileDescriptor.h"
#include "platform/host/files/SystemError.h"

namespace vesprun {
namespace {

/// A file that shrinks or grows meanwhile gives what was there.
bool readAll(int file, std::string& content) {
  std::size_t length = 0;
  for (;;) {
    if (length == content.size()) {
      content.resize(content.size() + (content.size() / 2) + 4096);
    }
    const ssize_t count = read(file, content.data() + length, content.size() - length);
    if (count < 0 && errno == EINTR) {
      continue;
    }
    if (count <= 0) {
      content.resize(length);
      return count == 0;
    }
    length += static_cast<std::size_t>(count);
  }
}

}  // namespace

std::optional<std::string> readWholeFile(const std::string& path, std::string& error,
                                         bool* missing) {
  // A pipe or device must not block the reader.
  const FileDescriptor file(open(path.c_str(), O_RDONLY | O_CLOEXEC | O_NONBLOCK));
  struct stat status {};
  std::optional<std::string> content;
  if (missing != nullptr) {
    *missing = !file.isOpen() && errno == ENOENT;
  }
  if (!file.isOpen() || fstat(file.get(), &status) != 0) {
    error = systemError(path);
  } else if (!S_ISREG(status.st_mode)) {
    error = path + (S_ISDIR(status.st_mode) ? ": Is a directory" : ": not a regular file");
  } else {
    content.emplace(static_cast<std::size_t>(status.st_size) + 1, '\0');
    if (!readAll(file.get(), *content)) {
      error = systemError(path);
      content.reset();
    }
  }
  return content;
}

}  // namespace vesprun
