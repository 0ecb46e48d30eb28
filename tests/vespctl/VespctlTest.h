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

  TemporaryFolder folder;
  std::string output;
  std::string error;
};

}  // namespace vesprun
