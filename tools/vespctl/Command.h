#pragma once

#include <CLI/CLI.hpp>
#include <functional>
#include <memory>
#include <stdexcept>
#include <string>

#include "common/PropertyValue.h"
#include "platform/host/HostPlatform.h"
#include "platform/host/files/Files.h"

namespace vesprun {

/// Ends the command with exit status 1 and its text on standard error.
class CommandFailure : public std::runtime_error {
 public:
  using std::runtime_error::runtime_error;
};

/// The result of `attempt(error)`. When it is empty, throws `CommandFailure` with the error.
template <typename Attempt>
auto orFail(const Attempt& attempt) {
  std::string error;
  auto result = attempt(error);
  if (!result) {
    throw CommandFailure(error);
  }
  return result;
}

/// Throws `CommandFailure` when the directory cannot be used; so do the next two.
std::unique_ptr<HostPlatform> openDevice(const std::string& directory);

/// Without changing anything on the device; see `HostPlatform::open`.
std::unique_ptr<HostPlatform> openDeviceReadOnly(const std::string& directory, SystemLog& log);

/// The directory alone, without its description.
DeviceDirectory openDirectory(const std::string& directory);

/// Waits until no run is at the daily work, and keeps others from it as long as the result lives.
/// Throws `CommandFailure` when that takes more than minutes.
FileDescriptor takeDailyWork(const DeviceDirectory& directory);

/// The content of a file or pipe; "-" is standard input.
std::string readInput(const std::string& file);

/// The content of a regular file; empty when there is none.
std::string contentIfThere(const HostPath& file);

/// Calls `take` with each line of a text, null for one that is not a JSON object.
void forEachLine(const std::string& text, const std::function<void(PropertyDict* line)>& take);

/// A file's name in messages: "-" is "standard input".
std::string inputName(const std::string& file);

/// Prints the JSON form and a line end.
void printJson(const PropertyValue& value);

/// Adds a command whose first argument is a device directory.
CLI::App* addDeviceCommand(CLI::App& above, const std::string& name, const std::string& description,
                           std::string& directory);

/// Allows one of `subject`'s commands. Refuses any other word, and a missing command that is
/// `needed`, with the names of all.
void allowOneCommand(CLI::App& subject, bool needed = true);

// Each in the file of its subject.
void addDeviceCommands(CLI::App& vespctl);
void addCounterCommands(CLI::App& vespctl);
void addCollectCommand(CLI::App& vespctl);
void addPreferenceCommands(CLI::App& vespctl);
void addMessageCommands(CLI::App& vespctl);
void addNandCommands(CLI::App& vespctl);
void addOutboxCommands(CLI::App& vespctl);
void addPtreeCommands(CLI::App& vespctl);
void addFieldsCommand(CLI::App& vespctl);
void addDecodeCommand(CLI::App& vespctl);
void addExportCommand(CLI::App& vespctl);
void addPageCommand(CLI::App& vespctl);
void addDaysCommand(CLI::App& vespctl);
void addCatchUpCommand(CLI::App& vespctl);
void addCompletionCommand(CLI::App& vespctl);
void addPruneCommand(CLI::App& vespctl);
void addOutlookCommands(CLI::App& vespctl);
void addWhitelistCommands(CLI::App& vespctl);

}  // namespace vesprun
