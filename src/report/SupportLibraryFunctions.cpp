#include "report/SupportLibraryFunctions.h"

#include "common/ProcessState.h"
#include "platform/Platform.h"

namespace vesprun {
namespace {

bool gBothResolved = false;
const ProcessState kResolvedState([] { gBothResolved = false; });

}  // namespace

bool resolveSupportLibraryFunctions() {
  if (gBothResolved) {
    return true;
  }
  SupportLibrary& library = platform().supportLibrary();
  if (!library.load()) {
    logMessage(LogLevel::Error, "Failed to dynamically load the FaultlineSupport framework");
    return false;
  }
  const bool reads = library.offers("LGSPreferencesGetIntegerValue");
  if (!reads) {
    logMessage(LogLevel::Error, "Failed to dyanmically link LGSPreferencesGetIntegerValue");
  }
  const bool writes = library.offers("LGSPreferencesSetValue");
  if (!writes) {
    logMessage(LogLevel::Error, "Failed to dynamically link LGSPreferencesSetValue");
  }
  gBothResolved = reads && writes;
  return gBothResolved;
}

}  // namespace vesprun
