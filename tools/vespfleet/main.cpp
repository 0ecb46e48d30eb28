#include <CLI/CLI.hpp>
#include <cstdio>
#include <cstring>
#include <fstream>
#include <iostream>
#include <map>
#include <new>

#include "ExportedLine.h"
#include "FleetStore.h"
#include "Statistics.h"
#include "commandline/Arguments.h"
#include "common/PropertyDict.h"
#include "platform/host/documents/JsonForm.h"
#include "platform/host/files/LineReader.h"
#include "platform/host/files/StandardStreams.h"

namespace vesprun {
namespace {

constexpr std::uint64_t kLeastDevices = 5;
constexpr std::size_t kLongestLine = std::size_t{64} * 1024 * 1024;

/// A question about one key.
struct Question {
  std::string store;
  std::string key;
  DayRange days;
  std::uint64_t least = kLeastDevices;  ///< fewer devices than this are only counted
};

void print(const PropertyDict& line) { std::cout << jsonText(line) << '\n'; }

/// False when a line or a file was not taken.
bool load(const std::string& address, const std::vector<std::string>& files) {
  const auto store = openFleetStore(address, true);
  std::uint64_t taken = 0;
  std::uint64_t malformed = 0;
  std::uint64_t unreadable = 0;
  std::string_view text;
  for (const std::string& file : files) {
    const std::string name = file == "-" ? "standard input" : file;
    std::ifstream opened;
    if (file != "-") {
      opened.open(file, std::ios::binary);
    }
    LineReader lines(file == "-" ? std::cin : opened, kLongestLine);
    auto result = lines.next(text);
    for (; result == LineReader::Result::Line || result == LineReader::Result::TooLong;
         result = lines.next(text)) {
      std::string why = "longer than 64 MiB";
      std::optional<ExportedLine> line;
      if (result == LineReader::Result::Line) {
        line = parseExportedLine(text, why);
      }
      if (line) {
        store->add(*line);
        ++taken;
      } else {
        ++malformed;
        std::fprintf(stderr, "%s:%llu: %s\n", name.c_str(),
                     static_cast<unsigned long long>(lines.number()), why.c_str());
      }
    }
    if (result == LineReader::Result::Failed) {
      ++unreadable;
      std::fprintf(stderr, "%s: %s\n", name.c_str(), std::strerror(errno));
    }
  }
  store->finish();
  print({{"files", static_cast<std::uint64_t>(files.size()) - unreadable},
         {"unreadableFiles", unreadable},
         {"lines", taken},
         {"malformedLines", malformed}});
  return malformed == 0 && unreadable == 0;
}

void printKeys(const std::string& address) {
  openFleetStore(address, false)->visitKeys([](const ReportedKey& key) {
    print({{"key", key.key},
           {"kind", key.kind == KeyKind::Scalar ? "scalar" : "distribution"},
           {"devices", key.devices},
           {"days", key.days}});
  });
}

void printScalar(const Question& question) {
  std::map<std::int32_t, std::vector<std::int64_t>> days;
  openFleetStore(question.store, false)
      ->visitScalars(question.key, question.days,
                     [&days](std::int32_t day, std::int64_t value) { days[day].push_back(value); });
  for (auto& [day, values] : days) {
    PropertyDict line{{"day", day}, {"devices", static_cast<std::uint64_t>(values.size())}};
    if (values.size() >= question.least) {
      const Summary summary = summaryOf(std::move(values));
      PropertyDict quantiles;
      for (std::size_t i = 0; i < std::size(kPercents); ++i) {
        quantiles.set(jsonText(PropertyValue(kPercents[i] / 100.0)), summary.quantiles[i]);
      }
      line.set("minimum", summary.minimum);
      line.set("maximum", summary.maximum);
      line.set("mean", summary.mean);
      line.set("quantiles", std::move(quantiles));
    }
    print(line);
  }
}

/// What the devices of one day reported.
struct DayOfDistribution {
  std::vector<Statistics> statistics;
  Histogram histogram;
  std::uint64_t histograms = 0;
};

void printDistribution(const Question& question) {
  std::map<std::int32_t, DayOfDistribution> days;
  openFleetStore(question.store, false)
      ->visitDistributions(question.key, question.days,
                           [&days](std::int32_t day, const Distribution& reported) {
                             DayOfDistribution& all = days[day];
                             all.statistics.push_back(reported.statistics);
                             if (reported.histogram) {
                               ++all.histograms;
                               for (const auto& [label, count] : *reported.histogram) {
                                 all.histogram[label] += count;
                               }
                             }
                           });
  for (auto& [day, all] : days) {
    const auto devices = static_cast<std::uint64_t>(all.statistics.size());
    std::string line =
        "{\"day\":" + std::to_string(day) + ",\"devices\":" + std::to_string(devices);
    if (devices >= question.least) {
      const Statistics merged = mergedStatistics(std::move(all.statistics));
      line += ",\"statistics\":" +
              jsonText(PropertyValue(PropertyArray{merged.minimum, merged.maximum, merged.mean,
                                                   merged.deviations, merged.count})) +
              ",\"histogram\":";
      if (all.histograms > 0 && all.histograms >= question.least) {
        bool overlap = false;
        PropertyDict histogram;
        for (const std::string& label : labelsInOrder(all.histogram, overlap)) {
          histogram.set(label, all.histogram.at(label));
        }
        line += jsonText(histogram);
        if (overlap) {
          std::fprintf(stderr,
                       "vespfleet: day %d: devices counted between different boundaries; their "
                       "buckets stand side by side\n",
                       day);
        }
      } else {
        line += "null";
      }
    }
    std::cout << line << "}\n";
  }
}

CLI::App* addQuestion(CLI::App& vespfleet, const char* name, const char* help, Question& question) {
  CLI::App* command = vespfleet.add_subcommand(name, help);
  command->add_option("STORE", question.store, "The store")->required();
  command->add_option("KEY", question.key, "The key")->required();
  command->add_option("--from", question.days.from, "First day, in days since 1970")
      ->transform(decimal<std::int32_t>());
  command->add_option("--to", question.days.to, "Last day")->transform(decimal<std::int32_t>());
  command
      ->add_option("--least", question.least,
                   "A day with fewer devices than this shows only their number")
      ->transform(decimal<std::uint64_t>())
      ->capture_default_str();
  return command;
}

int run(int argc, char** argv) {
  std::ios::sync_with_stdio(false);  // standard input is read in large pieces
  CLI::App vespfleet(
      "Keeps the daily logs of many devices and answers questions about them.\n"
      "STORE is the path of an SQLite file, or http://HOST:PORT/DATABASE of a ClickHouse server.",
      "vespfleet");
  vespfleet.require_subcommand(1);
  bool complete = true;

  std::string store;
  std::vector<std::string> files;
  CLI::App* loading = vespfleet.add_subcommand("load", "Takes lines that vespctl export wrote");
  loading->add_option("STORE", store, "The store; an SQLite file is made")->required();
  loading->add_option("FILE", files, "Files of lines, - for standard input")->required();
  loading->callback([&] { complete = load(store, files); });

  CLI::App* keys = vespfleet.add_subcommand("keys", "Lists the keys, with their devices and days");
  keys->add_option("STORE", store, "The store")->required();
  keys->callback([&] { printKeys(store); });

  Question question;
  addQuestion(vespfleet, "scalar", "Summarizes a scalar over the devices, a line for each day",
              question)
      ->callback([&] { printScalar(question); });
  addQuestion(vespfleet, "distribution",
              "Merges a distribution of the devices, a line for each day", question)
      ->callback([&] { printDistribution(question); });

  try {
    vespfleet.parse(argc, argv);
  } catch (const CLI::Success& help) {
    vespfleet.exit(help);
  } catch (const CLI::ParseError& error) {
    vespfleet.exit(error);
    return 2;
  } catch (const std::invalid_argument& usage) {
    std::fprintf(stderr, "vespfleet: %s\n", usage.what());
    return 2;
  }
  if (!std::cout.flush()) {
    std::fputs("vespfleet: standard output cannot be written\n", stderr);
    return 1;
  }
  return complete ? 0 : 1;
}

}  // namespace
}  // namespace vesprun

int main(int argc, char** argv) {
  try {
    vesprun::holdStandardStreams();
    return vesprun::run(argc, argv);
  } catch (const std::bad_alloc&) {
    std::fputs("vespfleet: out of memory\n", stderr);
  } catch (const std::exception& failure) {  // most are a `StoreFailure`
    std::fprintf(stderr, "vespfleet: %s\n", failure.what());
  }
  return 1;
}
