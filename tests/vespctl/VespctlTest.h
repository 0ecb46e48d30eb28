#pragma once

#include "support/Documents.h"
#include "support/ProgramTest.h"

namespace vesprun {

/// The program itself, on the device directory "$D", which `init` has made.
class VespctlTest : public ProgramTest {
 protected:
  VespctlTest() { EXPECT_EQ(run("init \"$D\""), 0) << error; }

  /// What follows `vespctl` in a shell; the exit status.
  int run(const std::string& arguments) {
    return runScript("D='" + folder.path("device") +
                     "'; export VESPRUN_DEVICE=\"$D\"; '" VESPCTL_PROGRAM "' " + arguments);
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

  /// Writes a JSON text as ptree document.
  void writePtree(std::string_view name, const std::string& json) {
    folder.write(name, ptreeOf(valueOfJson(json)));
  }

  /// Counts the lines of a dump.
  void import(const std::string& lines) {
    folder.write("lines", lines);
    print("counters import lines");
  }

  static constexpr const char* kWhitelist =
      "device/Library/Application Support/Tallybook/Whitelist_Stagebox.ptree";
};

}  // namespace vesprun
