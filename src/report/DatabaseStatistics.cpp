#include <string>

#include "platform/Platform.h"
#include "platform/PreferenceNames.h"
#include "report/SupportLibraryFunctions.h"
#include "report/TBReport.h"

namespace vesprun {
namespace {

constexpr std::uint64_t kBytesPerMebibyte = 1048576;
constexpr const char* kDatabasePath = "/var/mobile/Library/Tallybook/TBDataStore.sqlitedb";

std::int64_t databaseMebibytes() {
  const std::optional<std::uint64_t> bytes = platform().fileSystem().fileSize(kDatabasePath);
  return bytes ? static_cast<std::int64_t>(*bytes / kBytesPerMebibyte) : -1;
}

std::int64_t takeCorruptionCount() {
  if (!resolveSupportLibraryFunctions()) {
    return 0;
  }
  Preferences& preferences = platform().preferences();
  const std::int64_t count =
      preferences.LGSPreferencesGetIntegerValue(kCorruptionCountKey, kAggregatedDomain);
  preferences.LGSPreferencesSetValue(kCorruptionCountKey, 0, kAggregatedDomain);
  return count;
}

}  // namespace

void TBReport::reportDatabaseSize() {
  addScalarForKeyByExecutingBlock("com.quill.logsmith.tlyd.database.size", databaseMebibytes);
  addScalarForKeyByExecutingBlock("com.quill.logsmith.tlyd.database.corruptions",
                                  takeCorruptionCount);
}

}  // namespace vesprun
