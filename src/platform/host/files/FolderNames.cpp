#include "platform/host/files/FolderNames.h"

#include <dirent.h>

#include <algorithm>
#include <cerrno>
#include <memory>
#include <string_view>

#include "platform/host/files/SystemError.h"

namespace vesprun {

// The standard library's iterator ends the process when memory runs out.
std::optional<std::vector<std::string>> namesInFolder(const std::string& folder,
                                                      std::string& error) {
  struct Close {
    void operator()(DIR* stream) const { closedir(stream); }
  };
  std::vector<std::string> names;
  const std::unique_ptr<DIR, Close> stream(opendir(folder.c_str()));
  if (!stream && errno == ENOENT) {
    return names;
  }
  for (errno = stream ? 0 : errno; stream;) {
    const dirent* const entry = readdir(stream.get());
    if (entry == nullptr) {
      break;
    }
    const std::string_view name = entry->d_name;
    if (name != "." && name != "..") {
      names.emplace_back(name);
    }
    errno = 0;
  }
  if (errno != 0) {
    error = systemError(folder);
    return std::nullopt;
  }
  std::sort(names.begin(), names.end());
  return names;
}

}  // namespace vesprun
