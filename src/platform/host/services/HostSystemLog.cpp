#include "platform/host/services/HostSystemLog.h"

#include <cstdio>
#include <exception>
#include <string>
#include <utility>

#include "common/Calendar.h"
#include "platform/host/documents/JsonForm.h"
#include "platform/host/documents/QuotedText.h"

namespace vesprun {

void HostSystemLog::write(LogLevel level, std::string_view message) {
  if (!keeps(level)) {
    return;
  }
  std::string error;
  try {
    // Assembled here: a message may hold a long list, which no value should copy.
    std::string line =
        jsonText(PropertyDict{{"time", dateText(_clock.now())},
                              {"level", kLogLevelNames[static_cast<std::size_t>(level)]}});
    line.back() = ',';
    line.reserve(line.size() + message.size() + message.size() / 8 + 32);
    line += "\"message\":";
    appendJsonText(message, line);
    line += '}';
    if (_directory.makeFolder("outbox", error) && _lines.append(std::move(line), error)) {
      return;
    }
  } catch (const std::exception&) {
    error.clear();
  }
  while (message.ends_with('\n')) {
    message.remove_suffix(1);
  }
  try {
    std::fprintf(stderr, "vesprun: %s (not logged: %s)\n", printableText(message).c_str(),
                 error.empty() ? "out of memory" : printableText(error).c_str());
  } catch (const std::exception&) {
    std::fputs("vesprun: out of memory\n", stderr);
  }
}

}  // namespace vesprun
