#pragma once

#include <gmock/gmock.h>
#include <signal.h>
#include <sys/resource.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>

#include "platform/SystemLog.h"
#include "platform/host/counters/CounterLines.h"
#include "platform/host/counters/HostTallybook.h"
#include "platform/host/device/DeviceDirectory.h"
#include "support/TemporaryFolder.h"

namespace vesprun {

/// Keeps what is logged.
class MessageList final : public SystemLog {
 public:
  bool keeps(LogLevel /*level*/) const override { return true; }
  void write(LogLevel level, std::string_view message) override {
    EXPECT_EQ(level, LogLevel::Error);
    messages.emplace_back(message);
  }

  std::vector<std::string> messages;
};

/// The counters of these days as lines.
inline std::string linesOf(HostTallybook& tallybook, std::int32_t from = 0,
                           std::int32_t to = 99'999) {
  std::string error;
  std::string text;
  const auto append = [&text](std::string_view piece) { return !text.append(piece).empty(); };
  const auto work = [&](CounterStore& store) {
    EXPECT_TRUE(exportCounterLines(store, from, to, append, error)) << error;
  };
  EXPECT_TRUE(tallybook.read(work, error)) << error;
  return text;
}

/// A test of one service on an empty device directory.
class HostServiceTest : public ::testing::Test {
 protected:
  mode_t modeOf(std::string_view name) const {
    struct stat status {};
    EXPECT_EQ(lstat(folder.path(name).c_str(), &status), 0) << name;
    return status.st_mode;
  }

  TemporaryFolder folder;
  std::string error;
  DeviceDirectory device = DeviceDirectory::open(folder.path(), error).value();
  MessageList log;
};

/// Lets no file of this process grow beyond a size, as a full disk would.
class FileSizeLimit {
 public:
  explicit FileSizeLimit(rlim_t bytes) : _handler(signal(SIGXFSZ, SIG_IGN)) {
    getrlimit(RLIMIT_FSIZE, &_before);
    const rlimit limited{bytes, _before.rlim_max};
    setrlimit(RLIMIT_FSIZE, &limited);
  }
  ~FileSizeLimit() {
    setrlimit(RLIMIT_FSIZE, &_before);
    signal(SIGXFSZ, _handler);
  }

 private:
  rlimit _before{};
  sighandler_t _handler;
};

/// Starts `work` in a process of its own, which succeeds when no expectation of it fails.
template <typename Work>
pid_t startProcess(const Work& work) {
  const pid_t child = fork();
  if (child == 0) {
    work();
    _exit(::testing::Test::HasFailure() ? 1 : 0);
  }
  EXPECT_GT(child, 0);
  return child;
}

inline bool hasSucceeded(pid_t child) {
  int status = -1;
  return waitpid(child, &status, 0) == child && status == 0;
}

}  // namespace vesprun
