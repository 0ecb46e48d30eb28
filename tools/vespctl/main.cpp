#include <cstdio>
#include <exception>
#include <iostream>
#include <new>

#include "Command.h"
#include "platform/host/documents/QuotedText.h"
#include "platform/host/files/StandardStreams.h"

int main(int argc, char** argv) {
  vesprun::holdStandardStreams();
  CLI::App vespctl("Sets up a device directory, runs the daily job on it and shows what came out.",
                   "vespctl");
  vesprun::addDeviceCommands(vespctl);
  vesprun::addCounterCommands(vespctl);
  vesprun::addPreferenceCommands(vespctl);
  vesprun::addMessageCommands(vespctl);
  vesprun::addNandCommands(vespctl);
  vesprun::addOutboxCommands(vespctl);
  vesprun::addPtreeCommands(vespctl);
  vesprun::addFieldsCommand(vespctl);
  vesprun::addDecodeCommand(vespctl);
  vesprun::allowOneCommand(vespctl);
  try {
    vespctl.parse(argc, argv);
  } catch (const CLI::Success& help) {
    vespctl.exit(help);
  } catch (const CLI::ParseError& error) {
    vespctl.exit(error);
    return 2;
  } catch (const std::bad_alloc&) {
    std::fputs("vespctl: out of memory\n", stderr);
    return 1;
  } catch (const std::exception& failure) {  // most are a `CommandFailure`
    std::fprintf(stderr, "vespctl: %s\n", vesprun::printableText(failure.what()).c_str());
    return 1;
  }
  if (!std::cout.flush() || std::fflush(stdout) != 0) {
    std::fprintf(stderr, "vespctl: standard output cannot be written\n");
    return 1;
  }
  return 0;
}
