#include <cstdio>
#include <iostream>

#include "Command.h"

int main(int argc, char** argv) {
  CLI::App vespctl("Sets up a device directory, runs the daily job on it and shows what came out.",
                   "vespctl");
  vespctl.require_subcommand(1);
  vesprun::addDeviceCommands(vespctl);
  vesprun::addCounterCommands(vespctl);
  vesprun::addPreferenceCommands(vespctl);
  vesprun::addMessageCommands(vespctl);
  vesprun::addNandCommands(vespctl);
  vesprun::addOutboxCommands(vespctl);
  vesprun::addPtreeCommands(vespctl);
  vesprun::addFieldsCommand(vespctl);
  vesprun::addDecodeCommand(vespctl);
  try {
    vespctl.parse(argc, argv);
  } catch (const CLI::ParseError& error) {
    return vespctl.exit(error) == 0 ? 0 : 2;
  } catch (const vesprun::CommandFailure& failure) {
    std::fprintf(stderr, "vespctl: %s\n", failure.what());
    return 1;
  }
  if (!std::cout.flush() || std::fflush(stdout) != 0) {
    std::fprintf(stderr, "vespctl: standard output cannot be written\n");
    return 1;
  }
  return 0;
}
