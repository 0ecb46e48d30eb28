#include "device/CounterCommands.h"

#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <cstdio>
#include <cstring>
#include <filesystem>
#include <fstream>
#include <iostream>
#include <set>
#include <vector>

#include "access/CommandDevice.h"
#include "access/Complaints.h"
#include "access/ReadOnlyDevice.h"
#include "commandline/Arguments.h"
#include "commandline/Completion.h"
#include "commandline/Progress.h"
#include "common/Calendar.h"
#include "device/CounterRows.h"
#include "platform/host/counters/CounterLines.h"
#include "platform/host/counters/HostTallybook.h"
#include "platform/host/documents/NumberText.h"
#include "platform/host/documents/QuotedText.h"

namespace vesprun {
namespace {

struct CounterArguments {
  std::string key;
  std::vector<std::string> values;
  std::optional<GivenDay> day;
  GivenDays days;  ///< of a dump
  std::string file;
  bool replaces = false;
};

/// A bad number is an error of usage.
template <typename T>
T parseArgument(const char* argument, const std::string& text, const char* what) {
  T value = 0;
  if (!parseWholeText(text, value)) {
    throw CLI::ValidationError(argument, quotedText(text) + " is not " + what);
  }
  return value;
}

/// Damage to the database goes to standard error and to the device's system log.
class DeviceCounters {
 public:
  DeviceCounters()
      : _device(openDevice()),
        _complaints(&_device->systemLog()),
        _counters(_device->directory(), _device->clock(), _device->preferences(), _complaints) {}

  Date now() const { return _device->clock().now(); }

  void write(const std::function<bool(CounterStore&)>& work, std::string& error) {
    if (!_counters.write(work, error)) {
      _complaints.fail(error);
    }
    _complaints.print();
  }

  void read(const std::function<void(CounterStore&)>& work) {
    std::string error;
    if (!_counters.read(work, error)) {
      _complaints.fail(error);
    }
  }

 private:
  std::unique_ptr<HostPlatform> _device;
  Complaints _complaints;
  HostTallybook _counters;
};

/// Runs `change` with a valid key, on the given day or today.
void changeCounter(
    const CounterArguments& arguments,
    const std::function<void(CounterStore&, std::int32_t day, const Date& now)>& change) {
  DeviceCounters counters;
  const Date now = counters.now();
  const std::int32_t today = daysSince1970(now);
  const std::int32_t day = arguments.day ? arguments.day->on(today) : today;
  std::string error;
  if (!isCounterKey(arguments.key, error)) {
    throw CommandFailure(error);
  }
  const auto work = [&](CounterStore& store) {
    change(store, day, now);
    return true;
  };
  counters.write(work, error);
}

void changeScalar(const CounterArguments& arguments, bool adds) {
  const auto value =
      parseArgument<std::int64_t>("VALUE", arguments.values.front(), "a signed 64-bit integer");
  changeCounter(arguments, [&](CounterStore& store, std::int32_t day, const Date& /*now*/) {
    if (adds) {
      store.addToScalar(day, arguments.key, value);
    } else {
      store.setScalar(day, arguments.key, value);
    }
  });
}

/// Samples carry the clock's time of day.
void addSamples(const CounterArguments& arguments) {
  std::vector<double> values;
  values.reserve(arguments.values.size());
  for (const std::string& value : arguments.values) {
    values.push_back(parseArgument<double>("VALUE", value, "a double"));
  }
  changeCounter(arguments, [&](CounterStore& store, std::int32_t day, const Date& now) {
    const std::int64_t secondsInDay = now.seconds - startOfDay(daysSince1970(now)).seconds;
    std::vector<Sample> samples;
    samples.reserve(values.size());
    for (const double value : values) {
      samples.push_back({value, static_cast<std::int32_t>(secondsInDay)});
    }
    store.appendSamples(day, arguments.key, samples);
  });
}

/// The lines of a file or pipe, so that they can be read again and again.
class RepeatableLines {
 public:
  /// With the rights of the caller.
  explicit RepeatableLines(const std::string& file) : _isFile(file != "-") {
    struct stat status {};
    if (_isFile && stat(file.c_str(), &status) == 0 && S_ISREG(status.st_mode)) {
      _lines.open(file, std::ios::binary | std::ios::in);
    } else {
      openCopy();
      if (_isFile) {
        _pipe.open(file, std::ios::binary);
      } else {
        std::ios::sync_with_stdio(false);
      }
      _first = _isFile ? &_pipe : &std::cin;
    }
    if (_isFile && !(_first != nullptr ? _pipe.is_open() : _lines.is_open())) {
      throw CommandFailure(systemError(file));
    }
  }

  /// Reads a pipe for the first and only time: `keep` each line then.
  std::istream& first() { return _first != nullptr ? *_first : _lines; }

  void keep(std::string_view line) {
    if (_first != nullptr && !(_lines << line << '\n')) {
      throw CommandFailure(systemError("a temporary copy of the lines"));
    }
  }

  std::istream& again() {
    _lines.clear();
    if (!_lines.seekg(0)) {
      throw CommandFailure(systemError("the lines cannot be read again"));
    }
    return _lines;
  }

 private:
  /// A file without a name, which goes with the process.
  void openCopy() {
    std::string name = std::filesystem::temp_directory_path() / "vespctl-XXXXXX";
    const FileDescriptor file(mkstemp(name.data()));
    if (file.isOpen()) {
      _lines.open(name, std::ios::binary | std::ios::in | std::ios::out);
      unlink(name.c_str());
    }
    if (!_lines.is_open()) {
      throw CommandFailure(systemError(name));
    }
  }

  bool _isFile;
  std::ifstream _pipe;
  std::fstream _lines;
  std::istream* _first = nullptr;  ///< what can be read once
};

/// Other writers wait only for the second reading, which finds no bad line any more.
void importLines(const CounterArguments& arguments) {
  RepeatableLines lines(arguments.file);
  DeviceCounters counters;
  std::uint64_t count = 0;
  const auto checked = [&] {
    Progress progress("Checking", "lines");
    const auto keep = [&](std::string_view line) {
      lines.keep(line);
      ++count;
      progress.advance();
    };
    std::string cause;
    auto days = checkCounterLines(lines.first(), cause, keep);
    if (!days) {
      throw CommandFailure(inputName(arguments.file) + ": " + cause);
    }
    return *std::move(days);
  };
  const std::set<std::int32_t> days = checked();
  Progress progress("Importing", "lines", count);
  std::string error;
  const auto work = [&](CounterStore& store) {
    for (const std::int32_t day : days) {
      if (arguments.replaces) {
        store.removeDay(day);
      }
    }
    std::string cause = "changed while it was read";
    std::uint64_t taken = 0;
    const auto step = [&](std::string_view) {
      ++taken;
      progress.advance();
    };
    const bool good = importCounterLines(lines.again(), store, cause, step) && taken == count;
    if (!good) {
      error = inputName(arguments.file) + ": " + cause;
    }
    return good;
  };
  if (!days.empty()) {
    counters.write(work, error);
  }
}

void dumpLines(const CounterArguments& arguments) {
  DeviceCounters counters;
  const std::int32_t today = daysSince1970(counters.now());
  std::string outputFailure;
  const auto print = [&](std::string_view text) {
    if (std::fwrite(text.data(), 1, text.size(), stdout) != text.size() ||
        std::fflush(stdout) != 0) {
      outputFailure = std::string("standard output: ") + std::strerror(errno);
    }
    return outputFailure.empty();
  };
  std::string error;
  bool complete = true;
  const auto work = [&](CounterStore& store) {
    complete = exportCounterLines(store, arguments.days.first(today), arguments.days.last(today),
                                  print, error);
  };
  counters.read(work);
  if (!outputFailure.empty() || !complete) {
    throw CommandFailure(outputFailure.empty() ? error : outputFailure);
  }
}

void addKeyAndDay(CLI::App& command, CounterArguments& arguments) {
  completeWith(command.add_option("KEY", arguments.key, "The key of a counter")->required(),
               countedKeys);
  addDay(command, "--day", arguments.day, "The day, instead of today");
}

template <bool adds>
void addScalarChange(CLI::App& command) {
  const auto arguments = std::make_shared<CounterArguments>();
  addKeyAndDay(command, *arguments);
  command.add_option("VALUE", arguments->values, "A signed 64-bit integer")
      ->required()
      ->expected(1);
  command.callback([arguments] { changeScalar(*arguments, adds); });
}

void addSample(CLI::App& command) {
  const auto arguments = std::make_shared<CounterArguments>();
  addKeyAndDay(command, *arguments);
  command
      .add_option("VALUE", arguments->values,
                  "Doubles; -- before the first when there are -inf or such as -.5 among them")
      ->required()
      ->expected(-1);
  command.callback([arguments] { addSamples(*arguments); });
}

void addImport(CLI::App& command) {
  const auto arguments = std::make_shared<CounterArguments>();
  command.add_option("FILE", arguments->file, "\"-\": standard input")->required();
  command.add_flag("--replace", arguments->replaces,
                   "The days that FILE names hold exactly what FILE has of them");
  command.callback([arguments] { importLines(*arguments); });
}

void addDump(CLI::App& command) {
  const auto arguments = std::make_shared<CounterArguments>();
  addDays(command, arguments->days);
  command.callback([arguments] { dumpLines(*arguments); });
}

constexpr Command kCounterCommands[] = {
    {"get", "Shows the rows of a key", addGetCounters},
    {"set", "Sets a scalar", addScalarChange<false>},
    {"add", "Adds to a scalar, wrapping in 64 bits", addScalarChange<true>},
    {"sample", "Adds values to a distribution", addSample},
    {"import", "Takes all lines of a dump, or none", addImport},
    {"dump", "Prints counters as lines separated by tabs", addDump, Form::Own},
};

}  // namespace

void addCounterCommands(CLI::App& command) { addCommands(command, kCounterCommands); }

}  // namespace vesprun
