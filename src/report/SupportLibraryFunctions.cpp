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
  DeviceInformation& device = platform().deviceInformation();
  if (!device.loadSupportLibrary()) {
    logMessage(LogLevel::Error, "Failed to dynamically load the FaultlineSupport framework");
    return false;
  }
  const bool reads = device.supportLibraryOffers("LGSPreferencesGetIntegerValue");
  if (!reads) {
    logMessage(LogLevel::Error, "Failed to dyanmically link LGSPreferencesGetIntegerValue");
  }
  const bool writes = device.supportLibraryOffers("LGSPreferencesSetValue");
  if (!writes) {
    logMessage(LogLevel::Error, "Failed to dynamically link LGSPreferencesSetValue");
  }
  gBothResolved = reads && writes;
  return gBothResolved;
}

}  // namespace vesprun
