#include <cerrno>
#include <cstdio>
#include <cstring>
#include <fstream>
#include <iostream>
#include <limits>
#include <vector>

#include "Command.h"
#include "common/Date.h"
#include "platform/host/CounterLines.h"
#include "platform/host/QuotedText.h"
#include "platform/host/SqliteTallybook.h"

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

template <typename T>
T parseArgument(const std::string& text, const char* what) {
  T value = 0;
  if (!parseWholeText(text, value)) {
    throw CommandFailure(quotedText(text) + " is not " + what);
  }
  return value;
}

std::int32_t parseDay(const std::string& text, std::int32_t otherwise) {
  return text.empty() ? otherwise : parseArgument<std::int32_t>(text, "a day number");
}

/// Runs `change` with a day and a key that have been checked.
void changeCounter(
    const CounterArguments& arguments,
    const std::function<void(CounterStore&, std::int32_t day, const std::string& key)>& change) {
  const std::unique_ptr<HostPlatform> device = openDevice(arguments.device);
  SqliteTallybook& counters = device->counters();
  const std::int32_t day = parseDay(arguments.day, counters.TBDaysSince1970());
  std::string error;
  const auto work = [&](CounterStore& store) {
    change(store, day, arguments.key);
    return true;
  };
  if (!isCounterKey(arguments.key, error) || !counters.write(work, error)) {
    throw CommandFailure(error);
  }
}

void changeScalar(const CounterArguments& arguments, bool adds) {
  const auto value =
      parseArgument<std::int64_t>(arguments.values.front(), "a signed 64-bit integer");
  changeCounter(arguments, [&](CounterStore& store, std::int32_t day, const std::string& key) {
    if (adds) {
      store.addToScalar(day, key, value);
    } else {
      store.setScalar(day, key, value);
    }
  });
}

/// The samples carry the time of day that the device's clock shows.
void addSamples(const CounterArguments& arguments) {
  std::vector<Sample> samples;
  for (const std::string& value : arguments.values) {
    samples.push_back({parseArgument<double>(value, "a double"), 0});
  }
  const Date now = openDevice(arguments.device)->clock().now();
  const std::int64_t secondsInDay = now.seconds - startOfDay(daysSince1970(now)).seconds;
  for (Sample& sample : samples) {
    sample.secondsInDay = static_cast<std::int32_t>(secondsInDay);
  }
  changeCounter(arguments, [&](CounterStore& store, std::int32_t day, const std::string& key) {
    store.appendSamples(day, key, samples);
  });
}

void importLines(const CounterArguments& arguments) {
  const std::unique_ptr<HostPlatform> device = openDevice(arguments.device);
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
        error = "the counter database was damaged and has been replaced: import again";
        return false;
      }
    }
    std::string cause;
    const bool good = importCounterLines(lines, store, cause);
    if (!good) {
      error = arguments.file + ": " + cause;
    }
    return good;
  };
  if (!device->counters().write(work, error)) {
    throw CommandFailure(error);
  }
}

void dumpLines(const CounterArguments& arguments) {
  using Days = std::numeric_limits<std::int32_t>;
  const std::int32_t from = parseDay(arguments.from, Days::min());
  const std::int32_t to = parseDay(arguments.to, Days::max());
  const std::unique_ptr<HostPlatform> device = openDevice(arguments.device);
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
  const bool good = device->counters().read(work, error);
  if (!outputFailure.empty() || !good || !complete) {
    throw CommandFailure(outputFailure.empty() ? error : outputFailure);
  }
}

}  // namespace

void addCounterCommands(CLI::App& vespctl) {
  CLI::App* counters = vespctl.add_subcommand("counters", "Shows and changes counters");
  const auto arguments = std::make_shared<CounterArguments>();
  counters->add_option("DIR", arguments->device, "The device directory")->required();
  counters->require_subcommand(1);

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
  sample->add_option("VALUE", arguments->values, "Doubles; -inf and the like behind --")
      ->required()
      ->expected(-1);
  sample->callback([arguments] { addSamples(*arguments); });

  CLI::App* import = counters->add_subcommand("import", "Takes all lines of a dump, or none");
  import->add_option("FILE", arguments->file, "\"-\": standard input")->required();
  import->callback([arguments] { importLines(*arguments);
});

CLI::App* dump = counters->add_subcommand("dump", "Prints counters as lines parted by tabs");
dump->add_option("--from", arguments->from, "The first day number");
dump->add_option("--to", arguments->to, "The last day number");
dump->callback([arguments] { dumpLines(*arguments); });
}  // namespace vesprun

}  // namespace vesprun
