#include "commandline/Manual.h"

#include <fstream>
#include <iostream>
#include <map>
#include <vector>

#include "commandline/Program.h"

namespace vesprun {
namespace {

/// The file: what stands before and after the commands, and the text of each.
struct Prose {
  std::string before;
  std::string after;
  std::map<std::string, std::string> commands;
};

Prose readProse(const std::string& path) {
  std::ifstream file(path);
  Prose prose;
  std::string* part = &prose.before;
  for (std::string line; std::getline(file, line);) {
    if (line == "## Commands") {
      part = &prose.commands[""];
    } else if (part != &prose.before && line.starts_with("## ")) {
      part = &prose.after;
    }
    if (part != &prose.before && part != &prose.after && line.starts_with("### ")) {
      part = &prose.commands[line.substr(4)];
    } else {
      part->append(line) += '\n';
    }
  }
  if (!file.eof() || part != &prose.after) {
    throw CommandFailure(path + ": not a manual with a section Commands");
  }
  return prose;
}

/// Text that is not Markdown.
std::string escaped(const std::string& text) {
  std::string markdown;
  for (const char c : text) {
    markdown.append(c == '<' || c == '*' ? "\\" : "") += c;
  }
  return markdown;
}

std::string sentence(const std::string& help) {
  return help + (help.ends_with('?') || help.ends_with('.') ? "" : ".");
}

/// Without blank lines at its end.
void printText(const std::string& text) {
  std::cout << text.substr(0, text.find_last_not_of('\n') + 1) << '\n';
}

std::string termOf(const CLI::Option& option) {
  if (option.get_positional()) {
    return option.get_name(true) + (option.get_items_expected_max() > 1 ? "…" : "");
  }
  const std::string name = option.get_name(false, true);
  const std::string value = option.get_type_name();  // with what it must be, after a colon
  return option.get_items_expected_max() > 0 ? name + ' ' + value.substr(0, value.find(':')) : name;
}

/// Those that not every command has.
std::vector<const CLI::Option*> optionsOf(const CLI::App& command) {
  return command.get_options([](const CLI::Option* option) {
    return !option->check_lname("help") && !option->check_lname("json");
  });
}

std::string usageOf(const std::string& name, const CLI::App& command) {
  std::string usage = name;
  for (const CLI::Option* option : optionsOf(command)) {
    const std::string term = termOf(*option);
    usage += ' ' + (option->get_required() ? term : '[' + term + ']');
  }
  if (command.get_option_no_throw("--json") != nullptr) {
    usage += " [--json]";
  }
  return usage + (command.get_subcommands({}).empty() ? "" : " COMMAND …");
}

void printOptions(const CLI::App& command) {
  for (const CLI::Option* option : optionsOf(command)) {
    if (!option->get_description().empty()) {
      std::cout << "- `" << termOf(*option) << "`: " << sentence(escaped(option->get_description()))
                << '\n';
    }
  }
}

/// `above` is the program's name, and a command's that these are below.
void printCommands(const CLI::App& app, const std::string& above, Prose& prose) {
  for (const CLI::App* command : app.get_subcommands({})) {
    const std::string words = above + ' ' + command->get_name();
    const std::string name = words.substr(words.find(' ') + 1);
    std::cout << "\n### " << name << "\n\n`" << usageOf(words, *command) << "`\n\n"
              << sentence(escaped(command->get_description())) << "\n\n";
    printOptions(*command);
    if (const auto more = prose.commands.extract(name)) {
      printText(more.mapped());
    }
    printCommands(*command, words, prose);
  }
}

}  // namespace

void printManual(const CLI::App& program, const std::string& path) {
  Prose prose = readProse(path);
  std::cout << "# " << program.get_name() << "\n\n"
            << program.get_description() << "\n\n## Synopsis\n\n`"
            << usageOf(program.get_name(), program) << "`\n\n"
            << prose.before << "## Options\n\n";
  printOptions(program);
  std::cout << '\n';
  printText(prose.commands.extract("").mapped());
  printCommands(program, program.get_name(), prose);
  std::cout << '\n' << prose.after;
  if (!prose.commands.empty()) {
    throw CommandFailure(path + ": no command " + prose.commands.begin()->first);
  }
}

}  // namespace vesprun
