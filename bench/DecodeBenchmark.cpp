// Decoding whole statistics buffers, against loops that only walk them and format every name.

#include <benchmark/benchmark.h>

#include <array>
#include <cstdio>
#include <span>
#include <vector>

#include "NANDInfo/parsers/MSPRecord.h"
#include "NANDInfo/parsers/ORUFTLParseBufferToCxt.h"
#include "NANDInfo/parsers/ORUMSPKeyTable.h"
#include "NANDInfo/parsers/ORUMSPParseBufferToCxt.h"
#include "NANDInfo/parsers/ORUParseBufferToCxt.h"
#include "NANDInfo/parsers/ORUStatKeyTable.h"
#include "NANDInfo/parsers/StatisticsRecord.h"
#include "NANDInfo/sets/FilteredDict.h"
#include "NANDInfo/tables/FieldSets.h"
#include "buffers/DeviceBuffers.h"

namespace vesprun {
namespace {

/// Values of all magnitudes, so that rounding has something to do.
std::vector<std::uint64_t> values(std::size_t count, std::uint64_t seed) {
  std::vector<std::uint64_t> made(count);
  for (std::uint64_t& value : made) {
    seed = seed * 6364136223846793005U + 1442695040888963407U;
    value = seed >> (seed >> 58);
  }
  return made;
}

Bytes statisticsBuffer() {
  return everyStatistic([](const ORUStatKey& key) { return values(key.count, key.id); });
}

Bytes mspBuffer() {
  return everyMSPStatistic([](const ORUMSPKey& key) { return values(key.count, key.key); });
}

using NameText = std::array<char, 128>;

enum class Naming { WithUnderscore, Plain };

/// The plain way to name a field; nothing is done with the name.
template <Naming kNaming>
void formatNames(NameText& name, const char* statistic, std::uint32_t count) {
  if (count == 1) {
    std::snprintf(name.data(), name.size(), "%s", statistic);
    benchmark::DoNotOptimize(name);
    return;
  }
  for (std::uint32_t i = 0; i < count; ++i) {
    if constexpr (kNaming == Naming::WithUnderscore) {
      std::snprintf(name.data(), name.size(), "%s_%u", statistic, i);
    } else {
      std::snprintf(name.data(), name.size(), "%s%u", statistic, i);
    }
    benchmark::DoNotOptimize(name);
  }
}

template <Naming kNaming>
void walkStatistics(benchmark::State& state) {
  const Bytes buffer = statisticsBuffer();
  NameText name;
  for (auto _ : state) {
    StatisticsRecordReader reader(buffer);
    while (reader.remaining() != 0) {
      const StatisticsRecordHeader header = reader.readHeader();
      formatNames<kNaming>(name, findORUStatKey(header.id)->name.data(), header.count);
      reader.skip(header.count);
    }
  }
}

void walkFTL(benchmark::State& state) { walkStatistics<Naming::WithUnderscore>(state); }

void walkBase(benchmark::State& state) { walkStatistics<Naming::Plain>(state); }

void walkMSP(benchmark::State& state) {
  const Bytes buffer = mspBuffer();
  NameText name;
  for (auto _ : state) {
    MSPRecordReader reader(buffer);
    while (reader.holdsHeader()) {
      const MSPRecordHeader header = reader.readHeader();
      const ORUMSPKey* key = findORUMSPKey(header.key);
      formatNames<Naming::Plain>(name, key->name.data(), header.length / key->width());
      reader.read(header.length);
    }
  }
}

void decodeFTL(benchmark::State& state) {
  const Bytes buffer = statisticsBuffer();
  for (auto _ : state) {
    GenericParserCxt fields;
    ORUFTLParseBufferToCxt(fields, buffer);
    benchmark::DoNotOptimize(
        CreateFilteredDict_SigDig(fields, &WhitelistedRawNANDFTLCounters_SigDigDict, true));
  }
}

void decodeMSP(benchmark::State& state) {
  const Bytes buffer = mspBuffer();
  for (auto _ : state) {
    GenericParserCxt fields;
    ORUMSPParseBufferToCxt(fields, buffer);
    benchmark::DoNotOptimize(
        CreateFilteredDict_SigDig(fields, &WhitelistedRawNANDMSPCounters_SigDigDict, true));
  }
}

void decodeBase(benchmark::State& state) {
  const Bytes buffer = statisticsBuffer();
  for (auto _ : state) {
    ORUStatsContext context;
    ORUParseBufferToCxt(context, buffer);
    benchmark::DoNotOptimize(
        CreateFilteredDict_SigDig(context.fields, &WhitelistedRawNANDFTLCounters_SigDigDict, true));
  }
}

BENCHMARK(decodeFTL);
BENCHMARK(walkFTL);
BENCHMARK(decodeMSP);
BENCHMARK(walkMSP);
BENCHMARK(decodeBase);
BENCHMARK(walkBase);

}  // namespace
}  // namespace vesprun
