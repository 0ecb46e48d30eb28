#pragma once

#include <unistd.h>

#include <cerrno>
#include <utility>

namespace vesprun {

/// Owns a file descriptor.
class FileDescriptor {
 public:
  FileDescriptor() = default;
  explicit FileDescriptor(int descriptor) : _descriptor(descriptor) {}
  FileDescriptor(FileDescriptor&& other) noexcept
      : _descriptor(std::exchange(other._descriptor, -1)) {}
  FileDescriptor& operator=(FileDescriptor&& other) noexcept {
    std::swap(_descriptor, other._descriptor);
    return *this;
  }
  ~FileDescriptor() {
    if (_descriptor >= 0) {
      const int cause = errno;  // which the caller is about to report
      close(_descriptor);
      errno = cause;
    }
  }

  int get() const { return _descriptor; }
  bool isOpen() const { return _descriptor >= 0; }
  int release() { return std::exchange(_descriptor, -1); }

 private:
  int _descriptor = -1;
};

}  // namespace vesprun
