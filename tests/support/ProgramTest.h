#pragma once

#include <gmock/gmock.h>
#include <sys/wait.h>

#include <cstdlib>
#include <string>

#include "support/TemporaryFolder.h"

namespace vesprun {

/// A test of a program in a folder of its own.
class ProgramTest : public ::testing::Test {
 protected:
  /// Runs a bash script in the folder; the exit status, with what was printed in `output` and
  /// `error`.
  int runScript(const std::string& script) {
    const std::string start = "cd '" + folder.path() + "'; ";
    folder.write("script", start + script);
    // The shell has its say on a locale that the system does not know.
    const int status = std::system((start + "LC_ALL=C TZ=UTC bash script >output 2>error").c_str());
    output = folder.read("output");
    error = folder.read("error");
    return WIFEXITED(status) ? WEXITSTATUS(status) : -1;
  }

  TemporaryFolder folder;
  std::string output;
  std::string error;
};

}  // namespace vesprun
