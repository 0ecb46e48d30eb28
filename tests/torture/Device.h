#pragma once

#include <sys/types.h>

#include <filesystem>
#include <set>
#include <string>
#include <string_view>
#include <vector>

#include "TracedRun.h"

namespace vesprun::torture {

/// What broke, a sentence each.
using Faults = std::vector<std::string>;

/// Days since 1970 of the first run; its report is that of the day before.
inline constexpr int kFirstDay = 19787;

/// What can be seen of a device from outside.
struct Sight {
  /// A sentence for each counter, log, header, line and file. Lines of the system log are left out.
  std::set<std::string> facts;
  std::size_t dailyLogs = 0;
  Faults faults;  ///< what must never be seen
};

/// A device directory with something to do for every step of the day, whose clock stands still, and
/// whose counters include keys that no list names ("secret...").
class Device {
 public:
  /// Sets the device up in a new folder.
  explicit Device(const std::filesystem::path& folder);
  /// Copies it into another folder, whose content is replaced.
  Device(const Device& original, const std::filesystem::path& folder);

  const std::string& path() const { return _path; }

  /// The command line of words with a space between. "vesprun" is the job in the device's folder,
  /// "library" a program that counts, everything else `vespctl` on the device. "@" is its folder.
  std::vector<std::string> commandLine(const std::string& words) const;
  /// Runs it; the exit status. What it printed goes to `output`. Changes from outside are steps,
  /// too: "day N", "garbage FILE", "remove FILE", "stray-journal", "machines", "rows",
  /// "without-controller".
  int run(const std::string& words, std::string& output) const;
  /// Runs each; a fault for each one that fails and does not begin with "?".
  Faults run(const std::vector<std::string>& steps) const;

  /// Reads everything, and finds the faults that need no knowledge of what happened: half documents
  /// and lines, keys that no list names, counters that cannot be read. `numbered`: logs are kept
  /// apart by their numbers, and exported with their revisions.
  Sight look(bool numbered) const;

 private:
  void describe(const std::string& change) const;
  std::string _path;
};

/// A program that runs beside this one in `folder`, for a minute at most.
class Companion {
 public:
  Companion(const std::vector<std::string>& command, const std::string& folder);
  Companion(const Companion&) = delete;
  Companion& operator=(const Companion&) = delete;
  ~Companion() { status(); }

  /// Comes back when it has ended or all its threads sleep, which is how a lock is waited for.
  void endsOrWaits();
  /// Waits for its end; the exit status, -1 for a signal.
  int status();
  /// What it printed on both streams.
  std::string output() const { return _output.text(); }

 private:
  TextFile _output;
  pid_t _child = -1;
  int _status = 0;
  bool _ended = false;
};

/// True when an error's text ends where its reason should stand.
bool lacksCause(std::string_view message);

/// The program that "library" runs: counts with the C interface.
int countWithLibrary(const char* directory);

std::string readFile(const std::filesystem::path& path);
void writeFile(const std::filesystem::path& path, const std::string& content);

}  // namespace vesprun::torture
