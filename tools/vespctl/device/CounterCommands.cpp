#include "device/CounterCommands.h"

#include <cerrno>
#include <cstdio>
#include <cstring>
#include <fstream>
#include <iostream>
#include <limits>
#include <vector>

#include "Command.h"
#include "Complaints.h"
#include "commandline/Arguments.h"
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
  std::optional<GivenDay> from;
  std::optional<GivenDay> to;
  std::string file;
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

using Days = std::numeric_limits<std::int32_t>;

std::int32_t dayOr(const std::optional<GivenDay>& day, std::int32_t today, std::int32_t otherwise) {
  return day ? day->on(today) : otherwise;
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
  const std::int32_t day = dayOr(arguments.day, today, today);
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

void importLines(const CounterArguments& arguments) {
  std::ifstream file;
  const bool isFile = arguments.file != "-";
  if (isFile) {
    file.open(arguments.file, std::ios::binary);
    if (!file) {
      throw CommandFailure(arguments.file + ": " + std::strerror(errno));
    }
  } else {
    std::ios::sync_with_stdio(false);
  }
  DeviceCounters counters;
  std::istream& lines = isFile ? file : std::cin;
  bool isRepeated = false;
  std::string error;
  const auto work = [&](CounterStore& store) {
    if (std::exchange(isRepeated, true)) {
      lines.clear();
      if (!lines.seekg(0)) {
        // A pipe cannot be read again. Reading also finds out whether the database is damaged.
        const auto ignore = [](std::string_view) { return true; };
        exportCounterLines(store, Days::min(), Days::max(), ignore, error);
        error = "import again";
        return false;
      }
    }
    std::string cause;
    const bool good = importCounterLines(lines, store, cause);
    if (!good) {
      error = inputName(arguments.file) + ": " + cause;
    }
    return good;
  };
  counters.write(work, error);
}

void dumpLines(const CounterArguments& arguments) {
  DeviceCounters counters;
  const std::int32_t today = daysSince1970(counters.now());
  const std::int32_t from = dayOr(arguments.from, today, Days::min());
  const std::int32_t to = dayOr(arguments.to, today, Days::max());
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
    complete = exportCounterLines(store, from, to, print, error);
  };
  counters.read(work);
  if (!outputFailure.empty() || !complete) {
    throw CommandFailure(outputFailure.empty() ? error : outputFailure);
  }
}

void addKeyAndDay(CLI::App& command, CounterArguments& arguments) {
  command.add_option("KEY", arguments.key)->required();
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
  command.callback([arguments] { importLines(*arguments); });
}

void addDump(CLI::App& command) {
  const auto arguments = std::make_shared<CounterArguments>();
  addDay(command, "--from", arguments->from, "The first day");
  addDay(command, "--to", arguments->to, "The last day");
  command.callback([arguments] { dumpLines(*arguments); });
}

constexpr Command kCounterCommands[] = {
    {"get", "Shows the rows of a key", addGetCounters},
    {"set", "Sets a scalar", addScalarChange<false>},
    {"add", "Adds to a scalar, wrapping in 64 bits", addScalarChange<true>},
    {"sample", "Adds values to a distribution", addSample},
    {"import", "Takes all lines of a dump, or none", addImport},
    {"dump", "Prints counters as lines parted by tabs", addDump, Form::Own},
};

}  // namespace

void addCounterCommands(CLI::App& command) { addCommands(command, kCounterCommands); }

}  // namespace vesprun
