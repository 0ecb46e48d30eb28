#pragma once

#include <zlib.h>

#include <istream>
#include <memory>
#include <streambuf>
#include <string>

#include "platform/host/files/Files.h"

namespace vesprun {

/// The bytes of a file, unpacked when they begin as gzip does; several members are one text.
class LineSource : public std::istream {
 public:
  /// Takes the descriptor; one that is not open fails at the first read, with the `errno` of now.
  explicit LineSource(int descriptor);

  /// Why reading failed.
  const std::string& failure() const { return _buffer.failure; }
  /// Whether it was the gzip form that was wrong.
  bool isPacked() const { return _buffer.isPacked; }

 private:
  struct Close {
    void operator()(gzFile file) const { gzclose_r(file); }
  };
  struct Buffer : std::streambuf {
    int_type underflow() override;

    std::unique_ptr<gzFile_s, Close> file;
    std::string bytes;
    std::string failure;
    bool isPacked = false;
  };

  Buffer _buffer;
};

}  // namespace vesprun
