#include "platform/host/services/HostSystemLog.h"

#include <cstdio>
#include <string>

#include "common/Date.h"
#include "platform/host/documents/JsonForm.h"
#include "platform/host/documents/QuotedText.h"

namespace vesprun {
namespace {

constexpr std::string_view levelName(LogLevel level) {
  switch (level) {
    case LogLevel::Error:
      return "error";
    case LogLevel::Default:
      return "default";
    case LogLevel::Notice:
      return "notice";
    case LogLevel::Info:
      return "info";
    case LogLevel::Debug:
      return "debug";
  }
  return "";
}

}  // namespace

HostSystemLog::HostSystemLog(const DeviceDirectory& directory, Clock& clock, LogLevel lowestKept)
    : _directory(directory),
      _clock(clock),
      _lowestKept(lowestKept),
      _lines(directory.hostPath("outbox/log.jsonl")) {}

void HostSystemLog::write(LogLevel level, std::string_view message) {
  if (!keeps(level)) {
    return;
  }
  const PropertyDict line{
      {"time", dateText(_clock.now())}, {"level", levelName(level)}, {"message", message}};
  std::string error;
  if (!_directory.makeFolder("outbox", error) || !_lines.append(jsonText(line), error)) {
    message.remove_suffix(message.ends_with('\n') ? 1 : 0);  // some messages end their own line
    const std::string text = printableText(message);
    std::fprintf(stderr, "vesprun: %s (not logged: %s)\n", text.c_str(),
                 printableText(error).c_str());
  }
}

}  // namespace vesprun
