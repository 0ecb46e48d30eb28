#include "platform/host/files/LineReader.h"

#include <cerrno>
#include <cstring>
#include <utility>

namespace vesprun {

LineReader::LineReader(std::istream& stream, std::size_t longestLine)
    : _stream(&stream), _longestLine(longestLine), _error(stream ? 0 : errno) {}

LineReader::LineReader(FileDescriptor file, std::size_t longestLine)
    : _file(std::move(file)), _longestLine(longestLine), _error(_file.isOpen() ? 0 : errno) {}

LineReader::Result LineReader::next(std::string_view& line) {
  bool isTooLong = false;
  std::size_t searched = _begin;
  const void* feed = nullptr;
  while ((feed = std::memchr(_buffer.data() + searched, '\n', _end - searched)) == nullptr) {
    if (_end - _begin > _longestLine) {
      isTooLong = true;
      _begin = _end;
    }
    searched = _end - _begin;
    if (!readMore()) {
      break;
    }
  }
  if (_error == 0 && feed == nullptr && _begin == _end && !isTooLong) {
    return Result::End;
  }
  ++_number;
  if (_error != 0) {
    errno = _error;
    return Result::Failed;
  }
  const char* const begin = _buffer.data() + _begin;
  const char* const end = feed != nullptr ? static_cast<const char*>(feed) : _buffer.data() + _end;
  line = {begin, static_cast<std::size_t>(end - begin)};
  _begin = feed != nullptr ? _begin + line.size() + 1 : _end;
  return isTooLong || line.size() > _longestLine ? Result::TooLong : Result::Line;
}

bool LineReader::readMore() {
  constexpr std::size_t kReadSize = 256 * 1024;
  std::memmove(_buffer.data(), _buffer.data() + _begin, _end - _begin);
  _end -= _begin;
  _begin = 0;
  if (_buffer.size() < _end + kReadSize) {
    _buffer.resize(_end + kReadSize);
  }
  errno = 0;
  const std::ptrdiff_t count = read(_buffer.data() + _end, _buffer.size() - _end);
  if (count < 0) {
    _error = errno != 0 ? errno : EIO;
    return false;
  }
  _end += static_cast<std::size_t>(count);
  return count > 0;
}

std::ptrdiff_t LineReader::read(char* bytes, std::size_t size) {
  if (_stream != nullptr) {
    _stream->read(bytes, static_cast<std::streamsize>(size));
    return _stream->bad() ? -1 : _stream->gcount();
  }
  ssize_t count = 0;
  do {
    count = ::read(_file.get(), bytes, size);
  } while (count < 0 && errno == EINTR);
  return count;
}

}  // namespace vesprun
