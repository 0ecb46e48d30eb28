#include "platform/Platform.h"

#include <cassert>
#include <cstdarg>
#include <cstdio>
#include <cstdlib>
#include <string>

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

void logMessage(LogLevel level, const char* format, ...) {
  SystemLog& log = platform().systemLog();
  if (!log.keeps(level)) {
    return;
  }
  va_list arguments;
  va_start(arguments, format);
  va_list again;
  va_copy(again, arguments);
  std::string message(static_cast<std::size_t>(std::vsnprintf(nullptr, 0, format, arguments)),
                      '\0');
  std::vsnprintf(message.data(), message.size() + 1, format, again);
  va_end(again);
  va_end(arguments);
  log.write(level, message);
}

InstalledPlatform::InstalledPlatform(Platform& installed) {
  assert(gInstalledPlatform == nullptr);
  gInstalledPlatform = &installed;
}

InstalledPlatform::~InstalledPlatform() { gInstalledPlatform = nullptr; }

}  // namespace vesprun
