// Prints what a fleet of devices reported, day by day: as the lines that vespctl export writes, or
// as tab-separated key, day, device and value of the scalars alone. "shifted" are lines of which
// three scalars of one build are greater by a tenth of a standard deviation.

#include <cstdarg>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <random>
#include <string>
#include <vector>

namespace {

constexpr int kFirstDay = 20000;
constexpr int kKeysOfDistribution = 10;  // one key of so many is a distribution

struct Fleet {
  int devices;
  int keys;
  int days;
  std::uint64_t seed;
};

std::string keyName(int number) {
  return "com.example.subsystem" + std::to_string(number % 17) + ".counter" +
         std::to_string(number);
}

std::string deviceName(const Fleet& fleet, int number) {
  std::mt19937_64 random(fleet.seed + static_cast<std::uint64_t>(number));
  char name[33];
  std::snprintf(name, sizeof name, "%016llx%016llx", static_cast<unsigned long long>(random()),
                static_cast<unsigned long long>(random()));
  return name;
}

bool isDistribution(int key) { return key % kKeysOfDistribution == 0; }

std::uint64_t valueOf(std::mt19937_64& random) { return random() % 1'000'000; }

[[gnu::format(printf, 2, 3)]] void append(std::string& text, const char* format, ...) {
  char piece[512];
  va_list arguments;
  va_start(arguments, format);
  std::vsnprintf(piece, sizeof piece, format, arguments);
  va_end(arguments);
  text += piece;
}

constexpr int kShiftedKeys = 3;
constexpr unsigned long long kShift = 28'868;  // values are even from 0 to 1,000,000

void printLine(int day, const std::string& device, const char* build, bool isShifted,
               const std::vector<std::string>& keys, std::mt19937_64& random) {
  std::string scalars;
  std::string distributions;
  std::string histograms;
  for (std::size_t key = 0; key < keys.size(); ++key) {
    const char* const name = keys[key].c_str();
    const unsigned long long value = valueOf(random);
    if (!isDistribution(static_cast<int>(key))) {
      const bool isGreater = isShifted && key <= kShiftedKeys;
      append(scalars, "%s\"%s\":%llu", scalars.empty() ? "" : ",", name,
             value + (isGreater ? kShift : 0));
      continue;
    }
    const double mean = static_cast<double>(value) / 1024;
    const char* const comma = distributions.empty() ? "" : ",";
    append(distributions, "%s\"%s\":[0.5,%.17g,%.17g,%.17g,%llu]", comma, name, mean + 1000.25,
           mean + 0.125, mean * 7 + 0.5, value % 5000 + 1);
    append(histograms, "%s\"%s\":{\"(-inf, 10]\":%llu,\"(10, 100]\":%llu,\"(100, inf)\":%llu}",
           comma, name, value % 100 + 1, value % 77 + 1, value % 33 + 1);
  }
  std::printf(
      "{\"version\":2,\"device\":\"%s\",\"day\":%d,\"revision\":1,\"created\":{\"date\":"
      "\"2026-01-01T00:00:00Z\"},\"build\":\"%s\",\"model\":\"M1\",\"whitelist\":"
      "\"da8c42ede873a2ba43623ae0ba4d61c9\",\"scalars\":{%"
      "s}"
      ",\"distributions\":{%s},\"histograms\":{%s}}\n",
      device.c_str(), day, build, scalars.c_str(), distributions.c_str(), histograms.c_str());
}

void printRows(int day, const std::string& device, const char* /*build*/, bool /*isShifted*/,
               const std::vector<std::string>& keys, std::mt19937_64& random) {
  for (std::size_t key = 0; key < keys.size(); ++key) {
    const unsigned long long value = valueOf(random);
    if (!isDistribution(static_cast<int>(key))) {
      std::printf("%s\t%d\t%s\t%llu\n", keys[key].c_str(), day, device.c_str(), value);
    }
  }
}

}  // namespace

int main(int argc, char** argv) {
  const bool printsRows = argc == 6 && std::strcmp(argv[1], "rows") == 0;
  const bool shifts = argc == 6 && std::strcmp(argv[1], "shifted") == 0;
  if (argc != 6 || (!printsRows && !shifts && std::strcmp(argv[1], "lines") != 0)) {
    std::fprintf(stderr, "usage: MakeFleet lines|rows|shifted DEVICES KEYS DAYS SEED\n");
    return 2;
  }
  const Fleet fleet{std::atoi(argv[2]), std::atoi(argv[3]), std::atoi(argv[4]),
                    std::strtoull(argv[5], nullptr, 10)};
  std::vector<std::string> keys;
  keys.reserve(static_cast<std::size_t>(fleet.keys));
  for (int key = 0; key < fleet.keys; ++key) {
    keys.push_back(keyName(key));
  }
  const auto print = printsRows ? printRows : printLine;
  for (int day = kFirstDay; day < kFirstDay + fleet.days; ++day) {
    for (int device = 0; device < fleet.devices; ++device) {
      std::mt19937_64 random(fleet.seed * 31 + static_cast<std::uint64_t>(day) * 1'000'003 +
                             static_cast<std::uint64_t>(device));
      const bool isLater = device % 2 != 0;
      print(day, deviceName(fleet, device), isLater ? "24B2" : "24A1", shifts && isLater, keys,
            random);
    }
  }
  return 0;
}
