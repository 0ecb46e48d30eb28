#include "platform/host/outbox/PruneDays.h"

#include <sstream>

#include "platform/host/files/AtomicFile.h"
#include "platform/host/outbox/OutboxFiles.h"

namespace vesprun {
namespace {

constexpr std::string_view kPruneDaysFile = "outbox/.prune-days";
constexpr std::int64_t kMaxDaysAhead = 7;

}  // namespace

PruneDays PruneDays::read(const DeviceDirectory& directory) {
  constexpr std::uint64_t kMaxSize = 100;
  std::string ignored;
  std::istringstream text(
      readWholeFile(directory.hostPath(kPruneDaysFile), ignored, nullptr, kMaxSize).value_or(""));
  PruneDays days;
  std::int64_t day = 0;
  if (text >> day) {
    days.removed = day;
  }
  if (text >> day) {
    days.doubted = day;
  }
  return days;
}

bool PruneDays::write(const DeviceDirectory& directory, std::string& error) const {
  const std::string text = (removed ? std::to_string(*removed) : "") +
                           (doubted ? ' ' + std::to_string(*doubted) : "") + '\n';
  return directory.makeFolder(kOutbox, error) &&
         replaceFile(directory.hostPath(kPruneDaysFile), text, error);
}

bool PruneDays::believe(std::int64_t today) const {
  return !removed || today - kMaxDaysAhead <= *removed || (doubted && today > *doubted);
}

}  // namespace vesprun
