#include "platform/host/files/StandardStreams.h"

#include <fcntl.h>
#include <unistd.h>

namespace vesprun {

void holdStandardStreams() {
  for (int stream = STDIN_FILENO; stream <= STDERR_FILENO; ++stream) {
    if (fcntl(stream, F_GETFD) == -1) {
      // The lowest free number is taken: the streams below are there already.
      static_cast<void>(open("/dev/null", stream == STDIN_FILENO ? O_WRONLY : O_RDONLY));
    }
  }
}

}  // namespace vesprun
