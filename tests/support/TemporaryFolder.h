#pragma once

#include <string>
#include <string_view>
#include <vector>

namespace vesprun {

/// A new folder that is removed, with all that is in it, at the end of the test.
class TemporaryFolder {
 public:
  TemporaryFolder();
  ~TemporaryFolder();

  TemporaryFolder(const TemporaryFolder&) = delete;
  TemporaryFolder& operator=(const TemporaryFolder&) = delete;

  const std::string& path() const { return _path; }
  std::string path(std::string_view name) const { return _path + '/' + std::string(name); }

  /// Writes a file, making the folders above it.
  void write(std::string_view name, std::string_view content) const;
  /// The content of a file, which must be there.
  std::string read(std::string_view name) const;
  /// The names in a folder, hidden ones as well, sorted; none when the folder is missing.
  std::vector<std::string> names(std::string_view folder = ".") const;

 private:
  std::string _path;
};

}  // namespace vesprun
