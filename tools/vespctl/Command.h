#pragma once

#include <CLI/CLI.hpp>
#include <memory>
#include <stdexcept>
#include <string>

#include "common/PropertyValue.h"
#include "platform/host/HostPlatform.h"

namespace vesprun {

/// Ends the command with exit status 1 and one line, the text, on standard error.
class CommandFailure : public std::runtime_error {
 public:
  using std::runtime_error::runtime_error;
};

/// The platform of a device directory. Throws `CommandFailure` when there is none.
std::unique_ptr<HostPlatform> openDevice(const std::string& directory);

/// A device directory without what stands in its description. Throws `CommandFailure` when there is
/// none.
DeviceDirectory openDirectory(const std::string& directory);

/// The whole of a file or pipe, "-" for standard input. Throws `CommandFailure` when it cannot be
/// read.
std::string readInput(const std::string& file);

/// How a file that was given is called in a message: "-" is "standard input".
std::string inputName(const std::string& file);

/// Prints a value in its JSON form and ends the line.
void printJson(const PropertyValue& value);

/// Allows one command of those that `subject` has by now, and refuses any other word by naming
/// them. That none is given is refused, too, when one is `needed`.
void allowOneCommand(CLI::App& subject, bool needed = true);

// Each subject adds its commands to vespctl in a file of its own.
void addDeviceCommands(CLI::App& vespctl);
void addCounterCommands(CLI::App& vespctl);
void addPreferenceCommands(CLI::App& vespctl);
void addMessageCommands(CLI::App& vespctl);
void addNandCommands(CLI::App& vespctl);
void addOutboxCommands(CLI::App& vespctl);
void addPtreeCommands(CLI::App& vespctl);
void addFieldsCommand(CLI::App& vespctl);
void addDecodeCommand(CLI::App& vespctl);
void addExportCommand(CLI::App& vespctl);

}  // namespace vesprun
