#include "platform/host/WholeFile.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <cstring>

namespace vesprun {
namespace {

/// Reads until the end of the file; a file that shrinks or grows meanwhile gives what was there.
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
  // A pipe or device under the name must not stop the reader for ever.
  const int file = open(path.c_str(), O_RDONLY | O_CLOEXEC | O_NONBLOCK);
  struct stat status {};
  std::optional<std::string> content;
  const char* wrongKind = nullptr;
  errno = file < 0 ? errno : 0;
  if (file >= 0 && fstat(file, &status) == 0) {
    if (!S_ISREG(status.st_mode)) {
      wrongKind = S_ISDIR(status.st_mode) ? "Is a directory" : "not a regular file";
    } else {
      content.emplace(static_cast<std::size_t>(status.st_size) + 1, '\0');
      if (!readAll(file, *content)) {
        content.reset();
      }
    }
  }
  const int cause = errno;
  if (file >= 0) {
    close(file);
  }
  if (missing != nullptr) {
    *missing = !content && cause == ENOENT;
  }
  if (!content) {
    error = path + ": " + (wrongKind != nullptr ? wrongKind : std::strerror(cause));
  }
  return content;
}

}  // namespace vesprun
