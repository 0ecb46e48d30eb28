#include <string>

#include "platform/Platform.h"
#include "report/SupportLibraryFunctions.h"
#include "report/TBReport.h"

namespace vesprun {
namespace {

constexpr std::uint64_t kBytesPerMebibyte = 1048576;
constexpr std::string_view kCorruptionDomain = "com.quill.aggregated";
constexpr std::string_view kCorruptionCount = "DatabaseCorruptionCount";

std::int64_t databaseMebibytes() {
  static const std::string path =
      std::string("/var/mobile") + "/Library/Tallybook/TBDataStore.sqlitedb";
  const std::optional<std::uint64_t> bytes = platform().fileSystem().fileSize(path);
  return bytes ? static_cast<std::int64_t>(*bytes / kBytesPerMebibyte) : -1;
}

std::int64_t takeCorruptionCount() {
  if (!resolveSupportLibraryFunctions()) {
    return 0;
  }
  Preferences& preferences = platform().preferences();
  const std::int64_t count =
      preferences.LGSPreferencesGetIntegerValue(kCorruptionCount, kCorruptionDomain);
  preferences.LGSPreferencesSetValue(kCorruptionCount, 0, kCorruptionDomain);
  return count;
}

}  // namespace

void TBReport::reportDatabaseSize() {
  addScalarForKeyByExecutingBlock("com.quill.logsmith.tlyd.database.size", databaseMebibytes);
  addScalarForKeyByExecutingBlock("com.quill.logsmith.tlyd.database.corruptions",
                                  takeCorruptionCount);
}

}  // namespace vesprun
