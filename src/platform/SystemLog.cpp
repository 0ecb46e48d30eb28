#include "platform/SystemLog.h"

#include <cstdarg>
#include <cstdio>
#include <string>

#include "platform/Platform.h"

namespace vesprun {

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

}  // namespace vesprun
