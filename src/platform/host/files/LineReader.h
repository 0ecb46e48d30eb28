#pragma once

#include <cstddef>
#include <cstdint>
#include <istream>
#include <string>
#include <string_view>

#include "platform/host/files/FileDescriptor.h"

namespace vesprun {

/// Splits a stream or file at line feeds, in bounded memory; the last line may lack one.
class LineReader {
 public:
  enum class Result { Line, TooLong, End, Failed };

  /// `stream` must outlive the object. If it could not be opened, `errno` still says why.
  LineReader(std::istream& stream, std::size_t longestLine);
  LineReader(FileDescriptor file, std::size_t longestLine);

  /// Reads on. `Line` sets `line`, without its end and until the next call; `TooLong` has passed a
  /// line over; `Failed` leaves the reason in `errno`.
  Result next(std::string_view& line);

  /// The number of the last line read, from 1.
  std::uint64_t number() const { return _number; }

 private:
  bool readMore();
  std::ptrdiff_t read(char* bytes, std::size_t size);

  FileDescriptor _file;
  std::istream* _stream = nullptr;
  std::size_t _longestLine;
  int _error;
  std::string _buffer;
  std::size_t _begin = 0;
  std::size_t _end = 0;
  std::uint64_t _number = 0;
};

}  // namespace vesprun
