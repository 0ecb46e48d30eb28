#include "platform/host/files/StandardStreams.h"

#include <fcntl.h>
#include <signal.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cstdio>
#include <cstdlib>
#include <exception>
#include <new>

namespace vesprun {
namespace {

const char* programToExit;
int statusToExitWith;
std::terminate_handler otherTermination;

void terminate() {
  // Without an exception: it found no memory either.
  bool isOutOfMemory = std::current_exception() == nullptr;
  try {
    if (!isOutOfMemory) {
      throw;
    }
  } catch (const std::bad_alloc&) {
    isOutOfMemory = true;
  } catch (...) {
  }
  if (isOutOfMemory) {
    std::fprintf(stderr, "%s: out of memory\n", programToExit);
    _exit(statusToExitWith);
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

const char* journalLevel(LogLevel level) {
  static constexpr const char* kLevels[] = {"<3>", "<5>", "<5>", "<6>", "<7>"};
  const char* const journal = std::getenv("JOURNAL_STREAM");  // DEVICE:INODE
  struct stat status {};
  char* end = nullptr;
  const bool isJournal = journal != nullptr && fstat(STDERR_FILENO, &status) == 0 &&
                         std::strtoull(journal, &end, 10) == status.st_dev && *end == ':' &&
                         std::strtoull(end + 1, nullptr, 10) == status.st_ino;
  return isJournal ? kLevels[static_cast<std::size_t>(level)] : "";
}

void exitWithoutMemory(const char* program, int status) {
  programToExit = program;
  statusToExitWith = status;
  otherTermination = std::set_terminate(terminate);
}

}  // namespace vesprun
