// Fills a device directory with counters of the two days before its clock's, and an SQLite file
// with the same data in plain tables of one row for each value.

#include <sqlite3.h>

#include <charconv>
#include <cstdint>
#include <cstdio>
#include <memory>
#include <random>
#include <stdexcept>
#include <string>
#include <string_view>
#include <vector>

#include "platform/host/HostPlatform.h"
#include "platform/host/counters/HostTallybook.h"
#include "platform/host/documents/PtreeWriter.h"
#include "platform/host/files/AtomicFile.h"

namespace vesprun {
namespace {

constexpr int kScalarKeys = 100'000;
constexpr int kDistributionKeys = 5'000;
constexpr int kDays = 2;

std::string numberedKey(std::string_view stem, int number) {
  const std::string digits = std::to_string(number);
  return std::string(stem).append(6 - digits.size(), '0').append(digits);
}

std::string scalarKey(int number) { return numberedKey("com.quill.bench.scalar.", number); }

std::string distributionKey(int number) {
  return numberedKey("com.quill.bench.distribution.", number);
}

/// All keys; every other distribution has a histogram.
PropertyDict whitelist() {
  PropertyDict scalars;
  for (int i = 0; i < kScalarKeys; ++i) {
    scalars.set(scalarKey(i), PropertyDict{{"sig_fig", 3}});
  }
  const PropertyArray intervals{0, 1, 2, 5, 10, 20, 50, 100, 200, 500};
  PropertyDict distributions;
  for (int i = 0; i < kDistributionKeys; ++i) {
    distributions.set(distributionKey(i),
                      i % 2 == 0 ? PropertyDict{{"intervals", intervals}} : PropertyDict());
  }
  return {{"Bench", PropertyDict{{"ScalarKeys", std::move(scalars)},
                                 {"DistributionKeys", std::move(distributions)}}}};
}

/// The plain tables, written by SQLite's own interface: they are nothing of the program's.
class PlainTables {
 public:
  explicit PlainTables(const char* path) {
    sqlite3* database = nullptr;
    const int opened = sqlite3_open(path, &database);
    _database.reset(database);
    check(opened);
    execute(
        "PRAGMA journal_mode = OFF; PRAGMA synchronous = OFF;"
        "CREATE TABLE scalar (day INTEGER, key TEXT, value INTEGER);"
        "CREATE TABLE sample (day INTEGER, key TEXT, value REAL, offset INTEGER);"
        "CREATE TABLE whitelist (key TEXT PRIMARY KEY) WITHOUT ROWID;"
        "BEGIN");
    _scalar = prepare("INSERT INTO scalar VALUES (?, ?, ?)");
    _sample = prepare("INSERT INTO sample VALUES (?, ?, ?, ?)");
    _whitelist = prepare("INSERT INTO whitelist VALUES (?)");
  }

  void addScalar(std::int32_t day, const std::string& key, std::int64_t value) {
    sqlite3_bind_int64(_scalar.get(), 1, day);
    bindText(_scalar, 2, key);
    sqlite3_bind_int64(_scalar.get(), 3, value);
    run(_scalar);
  }
  void addSample(std::int32_t day, const std::string& key, const Sample& sample) {
    sqlite3_bind_int64(_sample.get(), 1, day);
    bindText(_sample, 2, key);
    sqlite3_bind_double(_sample.get(), 3, sample.value);
    sqlite3_bind_int64(_sample.get(), 4, sample.secondsInDay);
    run(_sample);
  }
  void addToWhitelist(const std::string& key) {
    bindText(_whitelist, 1, key);
    run(_whitelist);
  }
  void finish() { execute("COMMIT"); }

 private:
  struct Release {
    void operator()(sqlite3* database) const { sqlite3_close_v2(database); }
    void operator()(sqlite3_stmt* statement) const { sqlite3_finalize(statement); }
  };
  using Statement = std::unique_ptr<sqlite3_stmt, Release>;

  void check(int result) const {
    if (result != SQLITE_OK && result != SQLITE_DONE) {
      throw std::runtime_error(sqlite3_errmsg(_database.get()));
    }
  }
  void execute(const char* sql) {
    check(sqlite3_exec(_database.get(), sql, nullptr, nullptr, nullptr));
  }
  Statement prepare(const char* sql) {
    sqlite3_stmt* statement = nullptr;
    check(sqlite3_prepare_v2(_database.get(), sql, -1, &statement, nullptr));
    return Statement(statement);
  }
  void bindText(const Statement& statement, int parameter, const std::string& text) {
    check(sqlite3_bind_text(statement.get(), parameter, text.data(), static_cast<int>(text.size()),
                            SQLITE_STATIC));
  }
  void run(const Statement& statement) {
    check(sqlite3_step(statement.get()));
    check(sqlite3_reset(statement.get()));
  }

  std::unique_ptr<sqlite3, Release> _database;
  Statement _scalar;
  Statement _sample;
  Statement _whitelist;
};

void fillScalars(std::int32_t day, CounterStore& store, PlainTables& tables) {
  std::mt19937_64 random(static_cast<std::uint64_t>(day));
  for (int i = 0; i < kScalarKeys; ++i) {
    const std::string key = scalarKey(i);
    const auto value = static_cast<std::int64_t>(random() % 1'000'000);
    store.setScalar(day, key, value);
    tables.addScalar(day, key, value);
  }
}

void fillSamples(std::int32_t day, int valuesOfKey, CounterStore& store, PlainTables& tables) {
  std::mt19937_64 random(static_cast<std::uint64_t>(day));
  std::lognormal_distribution<double> values(2.0, 1.5);
  std::vector<Sample> samples(static_cast<std::size_t>(valuesOfKey));
  for (int i = 0; i < kDistributionKeys; ++i) {
    std::int32_t offset = 0;
    for (Sample& sample : samples) {
      sample = {values(random), offset};
      offset = (offset + 61) % 86'400;
    }
    const std::string key = distributionKey(i);
    store.appendSamples(day, key, samples);
    for (const Sample& sample : samples) {
      tables.addSample(day, key, sample);
    }
  }
}

void fill(const char* device, const char* tableFile, int valueCount) {
  std::string error;
  const std::unique_ptr<HostPlatform> platform = HostPlatform::open(device, error);
  if (!platform) {
    throw std::runtime_error(error);
  }
  std::string document;
  const std::string file = platform->directory().hostPath(
      "Library/Application Support/Tallybook/Whitelist_Stagebox.ptree");
  if (!writePtree(whitelist(), document, error) || !replaceFile(file, document, error)) {
    throw std::runtime_error(error);
  }

  PlainTables tables(tableFile);
  const std::int32_t today = platform->tallybook().TBDaysSince1970();
  const auto write = [&](CounterStore& store) {
    for (std::int32_t day = today - kDays; day < today; ++day) {
      fillScalars(day, store, tables);
      fillSamples(day, valueCount / kDays / kDistributionKeys, store, tables);
    }
    return true;
  };
  if (!platform->counters().write(write, error)) {
    throw std::runtime_error(error);
  }
  for (int i = 0; i < kScalarKeys; ++i) {
    tables.addToWhitelist(scalarKey(i));
  }
  for (int i = 0; i < kDistributionKeys; ++i) {
    tables.addToWhitelist(distributionKey(i));
  }
  tables.finish();
}

}  // namespace
}  // namespace vesprun

int main(int argc, char** argv) {
  int valueCount = 0;
  if (argc == 4) {
    std::from_chars(argv[3], argv[3] + std::string_view(argv[3]).size(), valueCount);
  }
  if (valueCount < 1) {
    std::fputs("usage: MakeReportData DEVICE NEW-SQLITE-FILE VALUES\n", stderr);
    return 2;
  }
  try {
    vesprun::fill(argv[1], argv[2], valueCount);
  } catch (const std::exception& failure) {
    std::fprintf(stderr, "MakeReportData: %s\n", failure.what());
    return 1;
  }
  return 0;
}
