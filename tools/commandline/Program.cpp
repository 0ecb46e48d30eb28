#include "commandline/Program.h"

#include <cerrno>
#include <cstdio>
#include <cstring>
#include <exception>
#include <iostream>
#include <new>
#include <utility>

#include "commandline/Completion.h"
#include "commandline/Manual.h"
#include "commandline/NearestName.h"
#include "commandline/Progress.h"
#include "platform/host/documents/QuotedText.h"
#include "platform/host/files/StandardStreams.h"

namespace vesprun {
namespace {

/// Refuses any other word than a command, and a missing command, with the names of all.
void needOneCommand(CLI::App& above) {
  above.require_subcommand(0, 1);
  above.allow_extras();
  above.parse_complete_callback([&above] {
    const std::vector<std::string> extras = above.remaining();
    const bool hasCommand = !above.get_subcommands().empty();
    if (extras.empty() && hasCommand) {
      return;
    }
    if (hasCommand && extras.front().starts_with('-')) {
      throw CLI::ValidationError(quotedText(extras.front()) +
                                 " stands before the command, but options of a command stand "
                                 "behind it");
    }
    NearestName nearest(extras.empty() ? std::string_view() : extras.front());
    std::string known;
    for (const CLI::App* command : above.get_subcommands(
             [](const CLI::App* command) { return !command->get_group().empty(); })) {
      known.append(known.empty() ? "" : ", ").append(command->get_name());
      nearest.take(command->get_name());
    }
    throw CLI::ValidationError(
        (extras.empty() ? "a command is missing"
                        : "unknown command " + quotedText(extras.front()) +
                              (nearest.isNear() ? ", perhaps \"" + nearest.found() + '"' : "")) +
        "; one of " + known);
  });
}

/// What the command line lacks, or has too much, and what it may have.
std::string explain(const CLI::App& app, const CLI::ParseError& error) {
  const CLI::App* command = &app;
  while (!command->get_subcommands().empty()) {
    command = command->get_subcommands().front();
  }
  std::string text = error.what();
  const std::vector<const CLI::Option*> options = command->get_options();
  const std::vector<std::string> extras = command->remaining();
  if (dynamic_cast<const CLI::ExtrasError*>(&error) != nullptr && !extras.empty()) {
    text = quotedText(extras.front()) + " is not expected here";
    if (app.get_option_no_throw(extras.front()) != nullptr) {
      return text + ": it stands before the command";
    }
    const char* separator = "; the options are ";
    for (const CLI::Option* option : options) {
      if (!option->get_positional()) {
        text.append(std::exchange(separator, ", ")).append(option->get_name());
      }
    }
  } else if (dynamic_cast<const CLI::RequiredError*>(&error) != nullptr) {
    for (const CLI::Option* option : options) {
      if (text.starts_with(option->get_name() + ' ') && !option->get_description().empty()) {
        return text + ": " + option->get_description();
      }
    }
  }
  return text;
}

int parse(CLI::App& app, int argc, char** argv) {
  try {
    app.parse(argc, argv);
  } catch (const CLI::Success& help) {
    app.exit(help);
  } catch (const CLI::ParseError& error) {
    complain(explain(app, error));
    std::fprintf(stderr, "Try \"%s --help\".\n", invocation().command.c_str());
    return 2;
  }
  if (!std::cout.flush()) {  // once more, for the reason
    std::cout.clear();
    errno = 0;
    std::cout.put('\n').flush();
    std::cout.setstate(std::ios::failbit);
  }
  if (!std::cout || std::fflush(stdout) != 0) {
    throw CommandFailure(std::string("standard output cannot be written: ") + std::strerror(errno));
  }
  return invocation().status;
}

}  // namespace

Invocation& invocation() {
  static Invocation invocation;
  return invocation;
}

void complain(std::string_view text) {
  Progress::hide();
  std::fprintf(stderr, "%s%s: %s\n", journalLevel(LogLevel::Error), invocation().command.c_str(),
               printableText(text).c_str());
}

void addCommands(CLI::App& above, std::span<const Command> commands) {
  for (const Command& row : commands) {
    CLI::App* const command = above.add_subcommand(row.name, row.help);
    command->preparse_callback([name = std::string(row.name)](std::size_t /*words*/) {
      invocation().command += ' ' + name;
    });
    if (row.form == Form::TextOrJson) {
      command->add_flag("--json", invocation().json, "Prints JSON, for programs");
    }
    row.add(*command);
  }
  needOneCommand(above);
}

int runProgram(const Program& program, int argc, char** argv) {
  holdStandardStreams();
  invocation().program = invocation().command = program.name;
  try {
    CLI::App app(program.help, program.name);
    app.set_version_flag("--version", std::string(program.name) + ' ' + VESPRUN_VERSION,
                         "Prints name and version");
    if (program.addOptions != nullptr) {
      program.addOptions(app);
    }
    addCommands(app, program.commands);
    if (argc > 2 && std::string_view(argv[1]) == kCompleteCommand) {
      printCompletions(app, std::span(argv + 3, argv + argc));
      return 0;
    }
    if (argc == 3 && argv[1] == kManualCommand) {
      printManual(app, argv[2]);
      return 0;
    }
    return parse(app, argc, argv);
  } catch (const std::bad_alloc&) {
    std::fprintf(stderr, "%s: out of memory\n", invocation().command.c_str());
  } catch (const std::exception& failure) {  // most are a `CommandFailure`
    std::cout.flush();
    complain(failure.what());
  }
  return 1;
}

}  // namespace vesprun
