#pragma once

#include <CLI/CLI.hpp>
#include <functional>
#include <span>
#include <string>
#include <string_view>
#include <vector>

namespace vesprun {

/// What may stand for the value of an option or a positional argument.
using Completer = std::function<std::vector<std::string>()>;

/// Without a completer, a value called FILE, PATH or STORE is that of a file, and DIR of a folder.
/// A completer that throws completes nothing.
void completeWith(CLI::Option* option, Completer completer);

/// The command `completion SHELL`, which prints a script for that shell.
void addCompletionCommand(CLI::App& command);

/// The scripts ask `PROGRAM complete -- WORDS`, the last word being completed. Answered are lines
/// of a word, a tab and a help text; ":files" and ":folders" stand for what the shell knows itself.
inline constexpr std::string_view kCompleteCommand = "complete";
void printCompletions(CLI::App& program, std::span<char* const> words);

}  // namespace vesprun
