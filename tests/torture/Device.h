#pragma once

#include <sys/types.h>

#include <filesystem>
#include <map>
#include <string>
#include <string_view>
#include <vector>

#include "TracedRun.h"

namespace vesprun::torture {

/// The programs under torture.
struct Programs {
  std::string vespctl;
  std::string vesprun;  ///< works on the folder it is started in
};

/// Days since 1970 of the first run; its report is that of the day before.
inline constexpr int kFirstDay = 19787;

/// What can be seen of a device from outside.
struct Sight {
  std::map<std::string, std::string> logs;  ///< name in the outbox to content
  std::vector<std::string> counters;        ///< rows as `vespctl counters dump` writes them
  std::vector<std::string> files;           ///< all other names
  std::vector<std::string> faults;          ///< what must never be seen
};

/// A device directory with something to do for every step of the day, whose clock stands still, and
/// whose counters include keys that no list names ("secret...").
class Device {
 public:
  /// Sets the device up in a new folder.
  Device(const Programs& programs, const std::filesystem::path& folder);
  /// A copy of it in another folder, in place of what is there.
  Device(const Device& original, const std::filesystem::path& folder);

  const std::string& path() const { return _path; }
  void setDay(int day);
  /// Lays a JSON object over the device's description; null removes an entry.
  void describe(const std::string& change);

  /// The command line of `vespctl` for a command and its arguments, without the device.
  std::vector<std::string> controlCommand(std::vector<std::string> words) const;
  /// Runs it; its exit status, and what it printed in `output`.
  int control(const std::vector<std::string>& words, std::string& output,
              const std::string& input = {}) const;
  /// The daily run, without a fault; its exit status.
  int runDaily() const;
  std::vector<std::string> dailyCommand() const { return {_programs->vesprun, "-d"}; }

  /// Reads everything, and finds the faults that need no knowledge of what happened: half documents
  /// and lines, keys that no list names, counters that cannot be read.
  Sight look() const;

 private:
  const Programs* _programs;
  std::string _path;
};

/// A program that runs beside this one in `folder`, with `input` on its standard input, for a
/// minute at most.
class Companion {
 public:
  Companion(const std::vector<std::string>& command, const std::string& folder,
            const std::string& input = {});
  Companion(const Companion&) = delete;
  Companion& operator=(const Companion&) = delete;
  ~Companion() { status(); }

  /// True when it ended within the time.
  bool endsWithin(int milliseconds);
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

std::string readFile(const std::filesystem::path& path);
void writeFile(const std::filesystem::path& path, const std::string& content);

}  // namespace vesprun::torture
