#include "whitelist/WhitelistInstallation.h"

#include <sys/stat.h>

#include "config/TBConfig.h"
#include "platform/host/files/AtomicFile.h"

namespace vesprun {
namespace {

bool replaceWithAccessOf(const struct stat& directory, const std::string& folder,
                         const std::string& name, std::string_view content, std::string& error) {
  std::optional<AtomicFile> file = AtomicFile::create(folder, error);
  if (!file) {
    return false;
  }
  file->takeAccessOf(directory);
  file->append(content);
  return file->replace(name, error);
}

}  // namespace

bool installWhitelist(const DeviceDirectory& directory, std::string_view document,
                      std::string& previous, std::string& error) {
  struct stat access {};
  if (stat(directory.path().c_str(), &access) != 0) {
    error = systemError(directory.path());
    return false;
  }
  const auto folder = directory.makeFolder(TBConfig::kFolder, error);
  if (!folder) {
    return false;
  }
  const std::string name(TBConfig::kFile);
  bool isMissing = false;
  const std::optional<std::string> before =
      readWholeFile(directory.hostPath(TBConfig::path()), error, &isMissing);
  if (!before && !isMissing) {
    return false;
  }
  const std::string previousName = name + ".previous";
  if (before) {
    if (!replaceWithAccessOf(access, *folder, previousName, *before, error)) {
      return false;
    }
    previous = directory.hostPath(TBConfig::path()).string() + ".previous";
  }
  return replaceWithAccessOf(access, *folder, name, document, error);
}

}  // namespace vesprun
