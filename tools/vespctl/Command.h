#pragma once

#include <CLI/CLI.hpp>
#include <charconv>
#include <concepts>
#include <limits>
#include <memory>
#include <stdexcept>
#include <string>
#include <system_error>

#include "common/PropertyValue.h"
#include "platform/host/HostPlatform.h"
#include "platform/host/documents/QuotedText.h"

namespace vesprun {

/// Ends the command with exit status 1 and one line, the text, on standard error.
class CommandFailure : public std::runtime_error {
 public:
  using std::runtime_error::runtime_error;
};

/// The platform of a device directory. Throws `CommandFailure` when there is none.
std::unique_ptr<HostPlatform> openDevice(const std::string& directory);

/// The same, to look at the device and change nothing on it; see `HostPlatform::openReadOnly`.
std::unique_ptr<HostPlatform> openDeviceReadOnly(const std::string& directory, SystemLog& log);

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

/// Takes a decimal integer that fits `T`, and nothing else: leading zeros mean nothing, and no
/// unsigned number has a sign.
template <std::integral T>
CLI::Validator decimal() {
  return CLI::Validator(
      [](std::string& text) {
        T number = 0;
        const char* const end = text.data() + text.size();
        const auto [rest, error] = std::from_chars(text.data(), end, number);
        if (error != std::errc() || rest != end) {
          return quotedText(text) + " is not a number from " +
                 std::to_string(std::numeric_limits<T>::min()) + " to " +
                 std::to_string(std::numeric_limits<T>::max());
        }
        text = std::to_string(number);
        return std::string();
      },
      "");
}

/// Allows one command of those that `subject` has by now, and refuses any other word by naming
/// them. That none is given is refused, too, when one is `needed`.
void allowOneCommand(CLI::App& subject, bool needed = true);

// Each subject adds its commands to vespctl in a file of its own.
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
void addPruneCommand(CLI::App& vespctl);
void addOutlookCommands(CLI::App& vespctl);
void addWhitelistCommands(CLI::App& vespctl);

}  // namespace vesprun
