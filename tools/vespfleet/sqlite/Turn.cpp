#include "Turn.h"

#include <fcntl.h>

#include <cerrno>
#include <cstring>

#include "store/FleetStore.h"

namespace vesprun {
namespace {

constexpr off_t kWaiting = off_t{1} << 62;
constexpr off_t kHeld = kWaiting + 1;

/// A lock of the open file, not of the process: SQLite's own locks on it stay when it is closed.
bool setLock(int file, short type, off_t byte) {
  struct flock lock {};
  lock.l_type = type;
  lock.l_whence = SEEK_SET;
  lock.l_start = byte;
  lock.l_len = 1;
  int result = 0;
  do {
    result = fcntl(file, F_OFD_SETLKW, &lock);
  } while (result != 0 && errno == EINTR);
  return result == 0;
}

}  // namespace

void Turn::open(const std::string& path) {
  _path = path;
  _file = FileDescriptor(::open(path.c_str(), O_RDWR | O_CLOEXEC | O_NONBLOCK));
  if (!_file.isOpen()) {
    throw StoreFailure(path + ": " + std::strerror(errno));
  }
}

void Turn::take() {
  const int file = _file.get();
  const bool taken = setLock(file, F_WRLCK, kWaiting) && setLock(file, F_WRLCK, kHeld) &&
                     setLock(file, F_UNLCK, kWaiting);
  if (!taken) {
    throw StoreFailure(_path + ": " + std::strerror(errno));
  }
}

void Turn::giveUp() { setLock(_file.get(), F_UNLCK, kHeld); }

}  // namespace vesprun
