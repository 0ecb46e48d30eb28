#include "platform/host/files/HostPath.h"

#include <fcntl.h>
#include <linux/openat2.h>
#include <sys/syscall.h>

#include <algorithm>
#include <cerrno>

namespace vesprun {
namespace {

FileDescriptor openWithoutLinks(int folder, const std::string& path, int flags, mode_t mode) {
  open_how how{};
  how.flags = static_cast<unsigned>(flags);
  how.mode = (flags & O_CREAT) != 0 ? mode : 0;
  how.resolve = RESOLVE_NO_SYMLINKS;
  long opened = -1;
  do {
    opened = syscall(SYS_openat2, folder, path.c_str(), &how, sizeof how);
  } while (opened < 0 && errno == EINTR);
  // A sandbox that does not know the call may say EPERM.
  return opened < 0 && (errno == ENOSYS || errno == EPERM)
             ? openStepByStep(folder, path, flags, mode)
             : FileDescriptor(static_cast<int>(opened));
}

}  // namespace

FileDescriptor openStepByStep(int folder, std::string_view path, int flags, mode_t mode) {
  FileDescriptor above;
  for (std::size_t end = path.find('/'); end != std::string_view::npos; end = path.find('/')) {
    if (end != 0) {
      FileDescriptor next(openat(above.isOpen() ? above.get() : folder,
                                 std::string(path.substr(0, end)).c_str(),
                                 O_PATH | O_DIRECTORY | O_NOFOLLOW | O_CLOEXEC));
      if (!next.isOpen()) {
        return next;
      }
      above = std::move(next);
    }
    path.remove_prefix(end + 1);
  }
  FileDescriptor file(openat(above.isOpen() ? above.get() : folder,
                             path.empty() ? "." : std::string(path).c_str(),
                             flags | O_NOFOLLOW | O_CLOEXEC, mode));
  struct stat status {};
  if (file.isOpen() && (flags & O_PATH) != 0 &&
      (fstat(file.get(), &status) != 0 || S_ISLNK(status.st_mode))) {
    file = FileDescriptor();
    errno = ELOOP;
  }
  return file;
}

HostPath HostPath::below(std::string_view path) const {
  HostPath result = *this;
  result._text.append("/").append(path);
  return result;
}

HostPath HostPath::folder() const {
  const std::size_t slash = _text.rfind('/');
  if (slash == std::string::npos) {
    return ".";
  }
  HostPath result = *this;
  result._text.resize(std::max<std::size_t>(slash, slash == 0 && _named != 0 ? 1 : 0));
  result._named = std::min(_named, result._text.size());
  return result;
}

FileDescriptor HostPath::open(int flags, mode_t mode) const {
  flags |= O_CLOEXEC;
  if (_named == _text.size()) {
    return FileDescriptor(::open(_text.c_str(), flags, mode));
  }
  const std::string named = _named == 0 ? "/" : _text.substr(0, _named);
  const FileDescriptor folder(::open(named.c_str(), O_PATH | O_DIRECTORY | O_CLOEXEC));
  const std::size_t rest = _text.find_first_not_of('/', _named);
  return folder.isOpen()
             ? openWithoutLinks(folder.get(), rest == std::string::npos ? "." : _text.substr(rest),
                                flags, mode)
             : FileDescriptor();
}

std::optional<struct stat> HostPath::status() const {
  struct stat status {};
  const FileDescriptor file = open(O_PATH);
  return file.isOpen() && fstat(file.get(), &status) == 0 ? std::optional(status) : std::nullopt;
}

}  // namespace vesprun
