#include "platform/Platform.h"

#include <cassert>
#include <cstdio>
#include <cstdlib>

namespace vesprun {
namespace {

Platform* gInstalledPlatform = nullptr;

}  // namespace

bool platformIsInstalled() { return gInstalledPlatform != nullptr; }

Platform& platform() {
  if (gInstalledPlatform == nullptr) {
    std::fputs("vesprun: no device is open\n", stderr);
    std::abort();
  }
  return *gInstalledPlatform;
}

InstalledPlatform::InstalledPlatform(Platform& installed) {
  assert(gInstalledPlatform == nullptr);
  gInstalledPlatform = &installed;
}

InstalledPlatform::~InstalledPlatform() { gInstalledPlatform = nullptr; }

}  // namespace vesprun
