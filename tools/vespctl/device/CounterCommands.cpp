#include <cerrno>
#include <cstdio>
#include <cstring>
#include <fstream>
#include <iostream>
#include <limits>
#include <vector>

#include "Command.h"
#include "Complaints.h"
#include "common/Calendar.h"
#include "platform/host/counters/CounterLines.h"
#include "platform/host/counters/HostTallybook.h"
#include "platform/host/documents/NumberText.h"
#include "platform/host/documents/QuotedText.h"

namespace vesprun {
namespace {

struct CounterArguments {
  std::string device;
  std::string key;
  std::vector<std::string> values;
  std::string day;
  std::string from;
  std::string to;
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

std::int32_t parseDay(const char* argument, const std::string& text, std::int32_t otherwise) {
  return text.empty() ? otherwise : parseArgument<std::int32_t>(argument, text, "a day number");
}

/// Damage to the database goes to standard error and to the device's system log.
class DeviceCounters {
 public:
  explicit DeviceCounters(const std::string& directory)
      : _device(openDevice(directory)),
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
  const std::int32_t givenDay = parseDay("--day", arguments.day, 0);
  DeviceCounters counters(arguments.device);
  const Date now = counters.now();
  const std::int32_t day = arguments.day.empty() ? daysSince1970(now) : givenDay;
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
  DeviceCounters counters(arguments.device);
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
  std::istream& lines = isFile ? file : std::cin;
  bool isRepeated = false;
  std::string error;
  const auto work = [&](CounterStore& store) {
    if (std::exchange(isRepeated, true)) {
      lines.clear();
      if (!lines.seekg(0)) {
        // A pipe cannot be read again. Reading also finds out whether the database is damaged.
        using Days = std::numeric_limits<std::int32_t>;
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
  using Days = std::numeric_limits<std::int32_t>;
  const std::int32_t from = parseDay("--from", arguments.from, Days::min());
  const std::int32_t to = parseDay("--to", arguments.to, Days::max());
  DeviceCounters counters(arguments.device);
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

}  // namespace

void addCounterCommands(CLI::App& vespctl) {
  const auto arguments = std::make_shared<CounterArguments>();
  CLI::App* counters =
      addDeviceCommand(vespctl, "counters", "Shows and changes counters", arguments->device);

  const auto addChange = [&](const char* name, const char* description) {
    CLI::App* command = counters->add_subcommand(name, description);
    command->add_option("KEY", arguments->key)->required();
    command->add_option("--day", arguments->day, "The day number, instead of today's");
    return command;
  };
  CLI::App* set = addChange("set", "Sets a scalar");
  set->add_option("VALUE", arguments->values, "A signed 64-bit integer")->required()->expected(1);
  set->callback([arguments] { changeScalar(*arguments, false); });

  CLI::App* add = addChange("add", "Adds to a scalar, wrapping in 64 bits");
  add->add_option("VALUE", arguments->values, "A signed 64-bit integer")->required()->expected(1);
  add->callback([arguments] { changeScalar(*arguments, true); });

  CLI::App* sample = addChange("sample", "Adds values to a distribution");
  sample
      ->add_option("VALUE", arguments->values,
                   "Doubles; -- before the first when there are -inf or such as -.5 among them")
      ->required()
      ->expected(-1);
  sample->callback([arguments] { addSamples(*arguments); });

  CLI::App* importing = counters->add_subcommand("import", "Takes all lines of a dump, or none");
  importing->add_option("FILE", arguments->file, "\"-\": standard input")->required();
  importing->callback([arguments] { importLines(*arguments); });

  CLI::App* dump = counters->add_subcommand("dump", "Prints counters as lines parted by tabs");
  dump->add_option("--from", arguments->from, "The first day number");
  dump->add_option("--to", arguments->to, "The last day number");
  dump->callback([arguments] { dumpLines(*arguments); });

  allowOneCommand(*counters);
}

}  // namespace vesprun
