#pragma once

#include <CLI/CLI.hpp>
#include <string>
#include <string_view>

namespace vesprun {

/// `PROGRAM manual FILE` prints the program's manual as Markdown: the file, with the options and
/// commands that the command line knows in its section "Commands". What the file has there under
/// the name of a command follows that command's own help. A name without a command is an error.
inline constexpr std::string_view kManualCommand = "manual";
void printManual(const CLI::App& program, const std::string& path);

}  // namespace vesprun
