#pragma once

#include <sys/stat.h>

#include <optional>
#include <string>
#include <string_view>
#include <utility>

#include "platform/host/files/FileDescriptor.h"

namespace vesprun {

/// The path of a file. Its first part is what the user named, where links lead on as usual. What
/// was added by `below` is walked without following any link: the content of a device directory may
/// have been laid out by someone else.
class HostPath {
 public:
  HostPath(std::string named) : _text(std::move(named)), _named(_text.size()) {}
  HostPath(const char* named) : HostPath(std::string(named)) {}

  /// `path` in this folder.
  HostPath below(std::string_view path) const;

  /// The folder of the file, "." for a name alone.
  HostPath folder() const;
  std::string name() const { return _text.substr(_text.rfind('/') + 1); }

  const std::string& string() const { return _text; }
  operator const std::string&() const { return _text; }

  /// As `open`, closed on exec; a link below what the user named is ELOOP.
  FileDescriptor open(int flags, mode_t mode = 0) const;

  /// What lies there, without opening it: nothing, with the cause in `errno`.
  std::optional<struct stat> status() const;

 private:
  std::string _text;
  std::size_t _named;  ///< how much of the text is the user's
};

/// What `HostPath::open` does on a kernel without the call for it: `path` below the open folder,
/// one name after another.
FileDescriptor openStepByStep(int folder, std::string_view path, int flags, mode_t mode);

}  // namespace vesprun
