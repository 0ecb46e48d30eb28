#pragma once

#include <CLI/CLI.hpp>
#include <map>
#include <optional>
#include <string>

#include "exchange/FigureRows.h"
#include "platform/host/HostPlatform.h"
#include "platform/host/outbox/DailyLogs.h"
#include "platform/host/outbox/LogNotes.h"

namespace vesprun {

/// Adds --device NAME, instead of the device's pseudonym.
CLI::Option* addDeviceName(CLI::App& command, std::string& name);

/// What leaves a device of its daily logs.
class LogExport {
 public:
  /// `name` may be empty. Throws `CommandFailure` when the outbox cannot be read.
  LogExport(HostPlatform& device, const std::string& name);

  const std::string& device() const { return _device; }
  FigureSource sourceOf(const DailyLog& log) const;

  /// The log as one line, without its end. Nothing, with the reason in `why`, when no store would
  /// take it.
  std::optional<std::string> lineOf(const DailyLog& log, std::string& why) const;

 private:
  SubmittedNote noteOn(const DailyLog& log) const;

  std::string _device;
  std::map<std::string, SubmittedNote> _notes;
};

}  // namespace vesprun
