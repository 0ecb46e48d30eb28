#include "LineReader.h"

#include <fcntl.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>

namespace vesprun {

LineReader::LineReader(const std::string& path)
    : _file(path == "-" ? dup(STDIN_FILENO) : open(path.c_str(), O_RDONLY | O_CLOEXEC)) {
  if (!_file.isOpen()) {
    _error = errno;
  }
}

bool LineReader::refill() {
  constexpr std::size_t kPiece = 256U * 1024;
  _piece.resize(kPiece);
  ssize_t count = -1;
  do {
    count = read(_file.get(), _piece.data(), kPiece);
  } while (count < 0 && errno == EINTR);
  if (count < 0) {
    _error = errno;
  }
  _at = 0;
  _piece.resize(count > 0 ? static_cast<std::size_t>(count) : 0);
  return count > 0;
}

LineReader::Result LineReader::next(std::string& line) {
  line.clear();
  bool tooLong = false;
  bool begun = false;
  while (_error == 0) {
    if (_at == _piece.size() && !refill()) {
      break;
    }
    const std::size_t end = std::min(_piece.find('\n', _at), _piece.size());
    begun = true;
    tooLong = tooLong || line.size() + (end - _at) > kLongestLine;
    if (!tooLong) {
      line.append(_piece, _at, end - _at);
    }
    _at = end;
    if (end < _piece.size()) {
      ++_at;
      break;
    }
  }
  if (_error != 0) {
    errno = _error;
    return Result::Failed;
  }
  if (!begun) {
    return Result::End;
  }
  ++_number;
  return tooLong ? Result::TooLong : Result::Line;
}

}  // namespace vesprun
