#include "config/InternalDevice.h"

#include <optional>

#include "common/ProcessState.h"
#include "platform/Platform.h"

namespace vesprun {
namespace {

std::optional<bool> gIsInternalDevice;
const ProcessState kAnswerState([] { gIsInternalDevice.reset(); });

}  // namespace

bool TBIsInternalDevice() {
  if (!gIsInternalDevice) {
    gIsInternalDevice = platform().deviceInformation().OrreryGetBoolAnswer("InternalBuild");
  }
  return *gIsInternalDevice;
}

}  // namespace vesprun
