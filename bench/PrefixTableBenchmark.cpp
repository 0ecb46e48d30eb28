// A look-up among prefixes, against one hash of the whole key.

#include <benchmark/benchmark.h>

#include <algorithm>
#include <functional>
#include <random>
#include <string>
#include <string_view>
#include <vector>

#include "config/PrefixTable.h"

namespace vesprun {
namespace {

constexpr int kKeys = 1024;

/// Prefixes as whitelists have them: a domain, a subsystem and the beginning of a name.
std::string prefix(int number) {
  return "com.quill.subsystem" + std::to_string(number % 100) + ".group" +
         std::to_string(number / 100) + '.';
}

/// Two of three keys begin with one of the prefixes. Of the others, one half differs from a prefix
/// only near its end, the other half has nothing in common with any.
std::vector<std::string> keys(int prefixCount) {
  std::vector<std::string> keys;
  for (int i = 0; i < kKeys; ++i) {
    std::string key = prefix(i * 7919 % prefixCount);
    if (i % 6 == 4) {
      key.back() = '_';
    } else if (i % 6 == 5) {
      key.replace(0, 3, "org");
    }
    keys.push_back(key + "counter" + std::to_string(i));
  }
  std::shuffle(keys.begin(), keys.end(), std::mt19937(20240305));
  return keys;
}

void lookUp(benchmark::State& state) {
  const int prefixCount = static_cast<int>(state.range(0));
  std::vector<std::string> prefixes;
  prefixes.reserve(static_cast<std::size_t>(prefixCount));
  for (int i = 0; i < prefixCount; ++i) {
    prefixes.push_back(prefix(i));
  }
  const PrefixTable table({prefixes.begin(), prefixes.end()});
  const std::vector<std::string> searched = keys(prefixCount);
  while (state.KeepRunningBatch(kKeys)) {
    for (const std::string& key : searched) {
      benchmark::DoNotOptimize(table.find(key));
    }
  }
}

/// What a look-up in a hash table would begin with.
void hashWholeKey(benchmark::State& state) {
  const std::vector<std::string> hashed = keys(100);
  while (state.KeepRunningBatch(kKeys)) {
    for (const std::string& key : hashed) {
      benchmark::DoNotOptimize(std::hash<std::string_view>()(key));
    }
  }
}

BENCHMARK(lookUp)->Arg(100);
BENCHMARK(hashWholeKey);

}  // namespace
}  // namespace vesprun
