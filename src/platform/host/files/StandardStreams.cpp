#include "platform/host/files/StandardStreams.h"

#include <fcntl.h>
#include <signal.h>
#include <unistd.h>

#include <cstdio>
#include <exception>
#include <new>

namespace vesprun {
namespace {

const char* programToExit;
int statusToExitWith;
std::terminate_handler otherTermination;

void terminate() {
  try {
    if (std::current_exception() != nullptr) {
      throw;
    }
  } catch (const std::bad_alloc&) {
    std::fprintf(stderr, "%s: out of memory\n", programToExit);
    _exit(statusToExitWith);
  } catch (...) {
  }
  otherTermination();
}

}  // namespace

void holdStandardStreams() {
  signal(SIGXFSZ, SIG_IGN);
  for (int stream = STDIN_FILENO; stream <= STDERR_FILENO; ++stream) {
    if (fcntl(stream, F_GETFD) == -1) {
      // open() takes the lowest free number, which is this stream's.
      static_cast<void>(open("/dev/null", stream == STDIN_FILENO ? O_WRONLY : O_RDONLY));
    }
  }
}

void exitWithoutMemory(const char* program, int status) {
  programToExit = program;
  statusToExitWith = status;
  otherTermination = std::set_terminate(terminate);
}

}  // namespace vesprun
