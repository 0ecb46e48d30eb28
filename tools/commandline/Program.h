#pragma once

#include <CLI/CLI.hpp>
#include <span>
#include <stdexcept>
#include <string>
#include <string_view>

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

/// What a command prints: most have `--json` beside their text for people.
enum class Form {
  TextOrJson,
  Own,  ///< a format of its own
};

/// A command. Help, completion and manual are made of its name, its help and what `add` adds:
/// arguments, a callback, and the commands below it.
struct Command {
  const char* name;
  const char* help;
  void (*add)(CLI::App& command);
  Form form = Form::TextOrJson;
};

/// Adds commands to a program or to a command. One of them is needed.
void addCommands(CLI::App& above, std::span<const Command> commands);

/// A program of commands.
struct Program {
  const char* name;
  const char* help;
  std::span<const Command> commands;
  void (*addOptions)(CLI::App& program) = nullptr;  ///< those that stand before the command
};

/// Does what the command line says, and returns the exit status.
int runProgram(const Program& program, int argc, char** argv);

/// This start of the program.
struct Invocation {
  std::string program;
  std::string command;  ///< the program and the words of its command
  bool json = false;    ///< results for programs, not for people
  int status = 0;       ///< to exit with, unless an error does
};
Invocation& invocation();

/// Prints a line on standard error that names the program and its command. What comes from outside
/// cannot reach the terminal as control characters.
void complain(std::string_view text);

}  // namespace vesprun
