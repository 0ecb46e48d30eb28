#pragma once

#include <cstddef>
#include <cstdint>
#include <string>

#include "platform/host/files/Files.h"

namespace vesprun {

/// Reads a file or pipe line by line in bounded memory.
class LineReader {
 public:
  static constexpr std::size_t kLongestLine = 64U * 1024 * 1024;

  enum class Result { Line, TooLong, End, Failed };

  /// Opens `path`, "-" for standard input. Whether that worked shows at the first `next`.
  explicit LineReader(const std::string& path);

  /// Reads on. `Line` sets `line` without its end; `Failed` leaves the reason in `errno`.
  Result next(std::string& line);

  /// The number of the line that `next` gave last, from 1.
  std::uint64_t number() const { return _number; }

 private:
  bool refill();

  FileDescriptor _file;
  int _error = 0;
  std::string _piece;
  std::size_t _at = 0;
  std::uint64_t _number = 0;
};

}  // namespace vesprun
