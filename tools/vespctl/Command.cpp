#include "Command.h"

#include <fcntl.h>
#include <unistd.h>

#include <chrono>
#include <iostream>
#include <sstream>

#include "platform/host/documents/JsonForm.h"
#include "platform/host/documents/QuotedText.h"
#include "platform/host/files/Files.h"
#include "platform/host/files/JsonLines.h"

namespace vesprun {

std::unique_ptr<HostPlatform> openDevice(const std::string& directory) {
  return orFail([&](std::string& error) { return HostPlatform::open(directory, error); });
}

std::unique_ptr<HostPlatform> openDeviceReadOnly(const std::string& directory, SystemLog& log) {
  return orFail([&](std::string& error) { return HostPlatform::open(directory, error, &log); });
}

DeviceDirectory openDirectory(const std::string& directory) {
  return *orFail([&](std::string& error) { return DeviceDirectory::open(directory, error); });
}

FileDescriptor takeDailyWork(const DeviceDirectory& directory) {
  constexpr std::chrono::minutes kLongestWait(5);
  return *orFail([&](std::string& error) {
    return lockFolder(directory.path(), error, LOCK_EX, kLongestWait);
  });
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

std::string contentIfThere(const HostPath& file) {
  return *orFail([&](std::string& error) {
    bool missing = false;
    std::optional<std::string> content = readWholeFile(file, error, &missing, kMaxLinesFile);
    return missing ? std::optional<std::string>("") : std::move(content);
  });
}

void forEachLine(const std::string& text, const std::function<void(PropertyDict* line)>& take) {
  std::istringstream lines(text);
  for (std::string line; std::getline(lines, line);) {
    std::string ignored;
    std::optional<PropertyValue> value = valueFromJsonText(line, ignored);
    take(value ? value->dict() : nullptr);
  }
}

std::string inputName(const std::string& file) { return file == "-" ? "standard input" : file; }

void printJson(const PropertyValue& value) { std::cout << jsonText(value) << '\n'; }

CLI::App* addDeviceCommand(CLI::App& above, const std::string& name, const std::string& description,
                           std::string& directory) {
  CLI::App* command = above.add_subcommand(name, description);
  command->add_option("DIR", directory, "The device directory")->required();
  return command;
}

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
