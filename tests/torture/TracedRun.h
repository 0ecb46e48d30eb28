#pragma once

#include <cstdint>
#include <functional>
#include <string>
#include <vector>

namespace vesprun::torture {

/// A file without a name, for what a program reads or prints: a pipe would have to be emptied
/// meanwhile.
class TextFile {
 public:
  explicit TextFile(const std::string& text = {});
  TextFile(const TextFile&) = delete;
  TextFile& operator=(const TextFile&) = delete;
  ~TextFile();

  int descriptor() const { return _file; }
  std::string text() const;

 private:
  int _file;
};

/// Starts a program in `folder` whose output goes to two descriptors; one that is not traced ends
/// after a minute at the latest, one that is stops before its first instruction. A program that
/// cannot be started ends with status 126.
pid_t start(const std::vector<std::string>& command, const std::string& folder, int output,
            int errors, bool isTraced);

/// The fault injected into one run.
struct Fault {
  enum class Kind {
    None,
    Error,     ///< the call answers `error` and is not made
    Short,     ///< a read or write that transfers half of what it was asked to, at least one byte
    Kill,      ///< SIGKILL in place of the call
    Pause,     ///< `whilePaused` runs before the call is made
    DiskFull,  ///< files below the watched folder grow by `room` more bytes, then never again
  };
  Kind kind = Kind::None;
  std::size_t call = 0;  ///< counted from 1, over all threads
  /// When there is one: the first call of this kind from there on. Threads do not always take turns
  /// alike.
  int number = -1;
  bool ofItsKind = false;  ///< `call` counts those of `number` alone
  int error = 0;
  bool lasts = false;  ///< the error, for all calls of its kind that follow
  std::uint64_t room = 0;
  std::function<void()> whilePaused = {};
};

/// One system call of a run without a fault.
struct Call {
  int number = 0;
  std::string path;        ///< of its descriptor or first path, when it is a file
  bool changes = false;    ///< something below the watched folder, or what the disk has of it
  std::uint64_t size = 0;  ///< bytes that such a write asks for
};

struct Outcome {
  int status = -1;  ///< exit status; -1 when a signal ended the program
  int signal = 0;
  bool late = false;  ///< stopped, since it took longer than the limit
  std::string standardError;
  std::vector<Call> calls;              ///< recorded only without a fault
  std::vector<std::string> notDurable;  ///< likewise: names given to bytes that were not flushed
  bool happened = false;                ///< the fault happened
  std::string place{};                  ///< the call that it happened to, with its path
};

/// Runs `command` in `folder` with every system call watched. Files below it are the ones whose
/// disk gets full and whose durability counts. Throws `std::runtime_error` when tracing is not
/// possible.
Outcome runTraced(const std::vector<std::string>& command, const std::string& folder,
                  const Fault& fault = {});

/// The errors that the call can give on a real system and that the program must survive; empty for
/// calls that cannot fail in a way that says anything.
const std::vector<int>& fittingErrors(int number);
bool transfersBytes(int number);
std::string nameOfCall(int number);

/// The longest time a run may take, in seconds.
inline constexpr unsigned kMaxRunSeconds = 60;

}  // namespace vesprun::torture
