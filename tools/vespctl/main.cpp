#include <cstdio>
#include <exception>
#include <iostream>
#include <new>

#include "Command.h"
#include "platform/host/documents/QuotedText.h"
#include "platform/host/files/StandardStreams.h"

namespace vesprun {
namespace {

// Before the command-line library makes its own global objects.
[[gnu::constructor(101)]] void prepare() { exitWithoutMemory("vespctl", 1); }

int runCommandLine(int argc, char** argv) {
  CLI::App vespctl("Sets up a device directory, runs the daily job on it and shows what came out.",
                   "vespctl");
  addDeviceCommands(vespctl);
  addCounterCommands(vespctl);
  addCollectCommand(vespctl);
  addPreferenceCommands(vespctl);
  addMessageCommands(vespctl);
  addNandCommands(vespctl);
  addOutboxCommands(vespctl);
  addPtreeCommands(vespctl);
  addFieldsCommand(vespctl);
  addDecodeCommand(vespctl);
  addExportCommand(vespctl);
  addPageCommand(vespctl);
  addDaysCommand(vespctl);
  addCatchUpCommand(vespctl);
  addPruneCommand(vespctl);
  addOutlookCommands(vespctl);
  addWhitelistCommands(vespctl);
  allowOneCommand(vespctl);
  try {
    vespctl.parse(argc, argv);
  } catch (const CLI::Success& help) {
    vespctl.exit(help);
  } catch (const CLI::ParseError& error) {
    vespctl.exit(error);
    return 2;
  }
  if (!std::cout.flush() || std::fflush(stdout) != 0) {
    throw CommandFailure("standard output cannot be written");
  }
  return 0;
}

}  // namespace
}  // namespace vesprun

int main(int argc, char** argv) {
  vesprun::holdStandardStreams();
  try {
    return vesprun::runCommandLine(argc, argv);
  } catch (const std::bad_alloc&) {
    std::fputs("vespctl: out of memory\n", stderr);
  } catch (const std::exception& failure) {  // most are a `CommandFailure`
    std::fprintf(stderr, "vespctl: %s\n", vesprun::printableText(failure.what()).c_str());
  }
  return 1;
}
