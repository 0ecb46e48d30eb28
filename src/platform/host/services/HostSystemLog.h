#pragma once

#include <cstdio>
#include <exception>
#include <string>
#include <utility>

#include "common/Calendar.h"
#include "platform/Clock.h"
#include "platform/SystemLog.h"
#include "platform/host/device/DeviceDirectory.h"
#include "platform/host/documents/JsonForm.h"
#include "platform/host/documents/QuotedText.h"
#include "platform/host/files/JsonLines.h"
#include "platform/host/files/StandardStreams.h"
#include "platform/host/outbox/OutboxFiles.h"

namespace vesprun {

/// `outbox/log.jsonl`; standard error gets what cannot be written there. Safe from any thread.
class HostSystemLog final : public SystemLog {
 public:
  HostSystemLog(const DeviceDirectory& directory, Clock& clock, LogLevel lowestKept)
      : _directory(directory), _clock(clock), _lowestKept(lowestKept) {}

  bool keeps(LogLevel level) const override { return level <= _lowestKept; }
  void write(LogLevel level, std::string_view message) override {
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
      if (_directory.makeFolder(kOutbox, error) && _lines.append(std::move(line), error)) {
        return;
      }
    } catch (const std::exception&) {
      error.clear();
    }
    while (message.ends_with('\n')) {
      message.remove_suffix(1);
    }
    try {
      std::fprintf(stderr, "%svesprun: %s (not logged: %s)\n", journalLevel(level),
                   printableText(message).c_str(),
                   error.empty() ? "out of memory" : printableText(error).c_str());
    } catch (const std::exception&) {
      std::fputs("vesprun: out of memory\n", stderr);
    }
  }

 private:
  const DeviceDirectory& _directory;
  Clock& _clock;
  LogLevel _lowestKept;
  JsonLines _lines{_directory.hostPath(kSystemLogFile)};
};

}  // namespace vesprun
