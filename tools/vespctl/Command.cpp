#include "Command.h"

#include <fcntl.h>
#include <unistd.h>

#include <iostream>

#include "platform/host/documents/JsonForm.h"
#include "platform/host/documents/QuotedText.h"
#include "platform/host/files/Files.h"

namespace vesprun {

std::unique_ptr<HostPlatform> openDevice(const std::string& directory) {
  std::string error;
  std::unique_ptr<HostPlatform> device = HostPlatform::open(directory, error);
  if (!device) {
    throw CommandFailure(error);
  }
  return device;
}

std::unique_ptr<HostPlatform> openDeviceReadOnly(const std::string& directory, SystemLog& log) {
  std::string error;
  std::unique_ptr<HostPlatform> device = HostPlatform::open(directory, error, &log);
  if (!device) {
    throw CommandFailure(error);
  }
  return device;
}

DeviceDirectory openDirectory(const std::string& directory) {
  std::string error;
  std::optional<DeviceDirectory> opened = DeviceDirectory::open(directory, error);
  if (!opened) {
    throw CommandFailure(error);
  }
  return *std::move(opened);
}

std::string readInput(const std::string& file) {
  const FileDescriptor input(file == "-" ? dup(STDIN_FILENO)
                                         : open(file.c_str(), O_RDONLY | O_CLOEXEC));
  std::string content;
  char piece[65536];
  ssize_t count = input.isOpen() ? 1 : -1;
  while (count > 0) {
    count = read(input.get(), piece, sizeof piece);
    if (count < 0 && errno == EINTR) {
      count = 1;
    } else if (count > 0) {
      content.append(piece, static_cast<std::size_t>(count));
    }
  }
  if (count < 0) {
    throw CommandFailure(systemError(inputName(file)));
  }
  return content;
}

std::string inputName(const std::string& file) { return file == "-" ? "standard input" : file; }

void printJson(const PropertyValue& value) { std::cout << jsonText(value) << '\n'; }

void allowOneCommand(CLI::App& subject, bool needed) {
  subject.require_subcommand(0, 1);
  subject.allow_extras();
  subject.parse_complete_callback([&subject, needed] {
    const std::vector<std::string> extras = subject.remaining();
    const bool hasCommand = !subject.get_subcommands().empty();
    if (extras.empty() && (hasCommand || !needed)) {
      return;
    }
    if (hasCommand) {
      throw CLI::ExtrasError(subject.get_name(), extras);
    }
    std::string known;
    for (const CLI::App* command : subject.get_subcommands({})) {
      known.append(known.empty() ? "" : ", ").append(command->get_name());
    }
    throw CLI::ValidationError(subject.get_name(),
                               (extras.empty() ? "a command is missing"
                                               : "unknown command " + quotedText(extras.front())) +
                                   "; one of " + known);
  });
}

}  // namespace vesprun
