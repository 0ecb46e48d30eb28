#include "platform/host/StandardStreams.h"

#include <fcntl.h>
#include <unistd.h>

namespace vesprun {

void holdStandardStreams() {
  for (const int stream : {STDIN_FILENO, STDOUT_FILENO, STDERR_FILENO}) {
    if (fcntl(stream, F_GETFD) == -1) {
      // The lowest free number is taken: the streams below are there already.
      static_cast<void>(open("/dev/null", stream == STDIN_FILENO ? O_WRONLY : O_RDONLY));
    }
  }
}

}  // namespace vesprun
