#include "platform/Platform.h"

#include <cassert>

namespace vesprun {
namespace {

Platform* gInstalledPlatform = nullptr;

}  // namespace

Platform& platform() {
  assert(gInstalledPlatform != nullptr);
  return *gInstalledPlatform;
}

InstalledPlatform::InstalledPlatform(Platform& installed) {
  assert(gInstalledPlatform == nullptr);
  gInstalledPlatform = &installed;
}

InstalledPlatform::~InstalledPlatform() { gInstalledPlatform = nullptr; }

}  // namespace vesprun
