#include "storage/NandCommands.h"

#include <unistd.h>

#include <algorithm>
#include <cctype>
#include <cstdio>
#include <vector>

#include "access/CommandDevice.h"
#include "commandline/Arguments.h"
#include "interface/EntryPoints.h"
#include "platform/host/files/Files.h"

namespace vesprun {
namespace {

/// Redirects standard output to standard error as long as it lives: lines that entry points print
/// must not mix with the result.
class StandardOutputAside {
 public:
  StandardOutputAside() : _kept(dup(STDOUT_FILENO)) {
    if (!_kept.isOpen() || dup2(STDERR_FILENO, STDOUT_FILENO) < 0) {
      throw CommandFailure(systemError("standard output"));
    }
  }
  ~StandardOutputAside() {
    std::fflush(stdout);
    dup2(_kept.get(), STDOUT_FILENO);
  }
  StandardOutputAside(const StandardOutputAside&) = delete;
  StandardOutputAside& operator=(const StandardOutputAside&) = delete;

 private:
  FileDescriptor _kept;
};

Json callAside(const EntryPointRow& row, std::span<const std::uint64_t> values) {
  const StandardOutputAside aside;
  return callToJson(row, values);
}

/// What the command line gave for one parameter.
struct GivenArgument {
  std::uint64_t number = 0;
  bool flag = false;
};

void addParameter(CLI::App& command, const EntryPointParameter& parameter, GivenArgument& given) {
  std::string name = parameter.name;
  if (parameter.isFlag()) {
    command.add_flag("--" + name, given.flag, parameter.help);
    return;
  }
  if (parameter.isNeeded) {
    std::transform(name.begin(), name.end(), name.begin(), [](char letter) {
      return static_cast<char>(std::toupper(static_cast<unsigned char>(letter)));
    });
  }
  given.number = parameter.absent;
  command.add_option(parameter.isNeeded ? name : "--" + name, given.number, parameter.help)
      ->required(parameter.isNeeded)
      ->transform(parameter.most == std::numeric_limits<std::uint64_t>::max()
                      ? decimal<std::uint64_t>()
                      : decimal<std::uint32_t>());
}

/// The entry point that the command's name stands for.
const EntryPointRow& rowOf(const CLI::App& command) {
  return *std::ranges::find(entryPoints(), command.get_name(), &EntryPointRow::command);
}

void addEntryPoint(CLI::App& command) {
  const EntryPointRow& row = rowOf(command);
  const auto given = std::make_shared<std::vector<GivenArgument>>(row.parameters.size());
  for (std::size_t i = 0; i < given->size(); ++i) {
    addParameter(command, row.parameters[i], (*given)[i]);
  }
  command.callback([given, &row] {
    std::vector<std::uint64_t> values;
    for (std::size_t i = 0; i < given->size(); ++i) {
      values.push_back(row.parameters[i].isFlag() ? (*given)[i].flag : (*given)[i].number);
    }
    const std::unique_ptr<HostPlatform> device = openDevice();
    const InstalledPlatform installed(*device);
    printResult(callAside(row, values));
  });
}

}  // namespace

void addNandCommands(CLI::App& command) {
  std::vector<Command> commands;
  for (const EntryPointRow& row : entryPoints()) {
    commands.push_back({row.command, row.help, addEntryPoint});
  }
  addCommands(command, commands);
}

}  // namespace vesprun
