#include "days/DailyWork.h"

#include "Command.h"

namespace vesprun {

FolderLock takeDailyWork(const DeviceDirectory& directory) {
  constexpr std::chrono::minutes kLongestWait(5);
  std::string error;
  std::optional<FolderLock> lock =
      FolderLock::take(directory.path(), error, FolderLock::Kind::Exclusive, kLongestWait);
  if (!lock) {
    throw CommandFailure(error);
  }
  return *std::move(lock);
}

}  // namespace vesprun
