#include "LineSource.h"

#include <cerrno>
#include <cstring>
#include <stdexcept>

namespace vesprun {

LineSource::LineSource(int descriptor) : std::istream(nullptr) {
  constexpr unsigned kBuffer = 256 * 1024;
  if (descriptor < 0) {
    _buffer.failure = std::strerror(errno);
  } else {
    _buffer.file.reset(gzdopen(descriptor, "rb"));
    if (!_buffer.file) {
      close(descriptor);
      throw std::bad_alloc();
    }
    gzbuffer(_buffer.file.get(), kBuffer);
    _buffer.bytes.resize(kBuffer);
  }
  rdbuf(&_buffer);
}

/// An exception makes the stream bad.
LineSource::Buffer::int_type LineSource::Buffer::underflow() {
  if (!file) {
    throw std::runtime_error(failure);
  }
  errno = 0;
  const int length = gzread(file.get(), bytes.data(), static_cast<unsigned>(bytes.size()));
  if (length > 0) {
    setg(bytes.data(), bytes.data(), bytes.data() + length);
    return traits_type::to_int_type(bytes.front());
  }
  int code = Z_OK;
  gzerror(file.get(), &code);
  if (length == 0 && (code == Z_OK || code == Z_STREAM_END)) {
    return traits_type::eof();
  }
  failure = code == Z_ERRNO       ? std::strerror(errno)
            : code == Z_BUF_ERROR ? "the gzip data breaks off"
                                  : "the gzip data is damaged";
  isPacked = code != Z_ERRNO;
  throw std::runtime_error(failure);
}

}  // namespace vesprun
