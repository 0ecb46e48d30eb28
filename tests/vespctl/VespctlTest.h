#pragma once

#include <gmock/gmock.h>
#include <sys/wait.h>

#include <cstdlib>
#include <string>

#include "support/TemporaryFolder.h"

namespace vesprun {

/// The program itself, on the device directory "$D", which `init` has made.
class VespctlTest : public ::testing::Test {
 protected:
  VespctlTest() { EXPECT_EQ(run("init \"$D\""), 0) << error; }

  /// What follows `vespctl` in a shell; the exit status, with what was printed in `output` and
  /// `error`.
  int run(const std::string& arguments) {
    const std::string script = "D='" + folder.path("device") + "'; cd '" + folder.path() +
                               "'; '" VESPCTL_PROGRAM "' " + arguments;
    folder.write("script", script);
    const int status = std::system(("bash '" + folder.path("script") + "' >'" +
                                    folder.path("output") + "' 2>'" + folder.path("error") + '\'')
                                       .c_str());
    output = folder.read("output");
    error = folder.read("error");
    return WIFEXITED(status) ? WEXITSTATUS(status) : -1;
  }

  /// Runs the command, which must succeed, and gives what it printed.
  std::string print(const std::string& arguments) {
    EXPECT_EQ(run(arguments), 0) << arguments << ": " << error;
    return output;
  }

  /// What a shell command prints in the folder of the device directory.
  std::string shell(const std::string& command) { return print("fields >/dev/null; " + command); }

  /// Everything in the device directory, with times and modes.
  std::string snapshot() {
    return shell(
        "find device -printf '%p %T@ %m %i\\n' | sort; "
        "find device -type f -print0 | sort -z | xargs -0 sha256sum");
  }

  /// Counts the lines of a dump.
  void import(const std::string& lines) {
    folder.write("lines", lines);
    print("counters \"$D\" import lines");
  }

  static constexpr const char* kWhitelist =
      "device/Library/Application Support/Tallybook/Whitelist_Stagebox.ptree";
  TemporaryFolder folder;
  std::string output;
  std::string error;
};

}  // namespace vesprun
