#include "config/InternalDevice.h"

#include <optional>

#include "platform/Platform.h"

namespace vesprun {
namespace {

std::optional<bool> gIsInternalDevice;

}  // namespace

bool TBIsInternalDevice() {
  if (!gIsInternalDevice) {
    gIsInternalDevice = platform().orrery().OrreryGetBoolAnswer("InternalBuild");
  }
  return *gIsInternalDevice;
}

void forgetInternalDeviceAnswer() { gIsInternalDevice.reset(); }

}  // namespace vesprun
