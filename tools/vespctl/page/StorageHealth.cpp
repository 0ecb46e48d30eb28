#include "page/StorageHealth.h"

#include <algorithm>
#include <cmath>
#include <initializer_list>

#include "common/Calendar.h"
#include "page/Quantity.h"

namespace vesprun {
namespace {

using HealthLevel = HealthStatement::Level;

// Percentages: of the rated erase cycles, of the spare blocks, of the capacity.
constexpr double kWearToLookAt = 80;
constexpr double kWearToActOn = 100;
constexpr double kSpareToLookAt = 99;
constexpr double kSpareToActOn = 10;
constexpr double kFullnessToLookAt = 95;

struct Fact {
  double value;
  double day;
};

using Names = std::initializer_list<std::string_view>;

/// The newest value of each figure, by its name without the prefix that all have.
class Facts {
 public:
  explicit Facts(const PageData& data) {
    constexpr std::string_view kKeys = "com.quill.NANDInfo.";
    constexpr std::string_view kEvents = "com.quill.massStorage.NANDInfo.";
    for (auto series = data.scalars.lower_bound(kKeys);
         series != data.scalars.end() && series->first.starts_with(kKeys); ++series) {
      const PageData::Value& newest = series->second.back();
      take(series->first.substr(kKeys.size()), newest.value.asDouble(), newest.day);
    }
    for (auto event = data.events.lower_bound(std::string(kEvents));
         event != data.events.end() && event->first.starts_with(kEvents); ++event) {
      takeEvent(event->first.substr(kEvents.size()), event->second.newest.back());
    }
    if (data.storageLog && data.storageLog->date) {
      const double day = static_cast<double>(data.storageLog->date->seconds) / kSecondsPerDay;
      for (const auto& [name, value] : data.storageLog->fields) {
        take(name.starts_with(kKeys) ? name.substr(kKeys.size()) : name, value, day);
      }
    }
  }

  /// The newest figure under any of the names.
  std::optional<Fact> find(Names names) const {
    std::optional<Fact> newest;
    for (const std::string_view name : names) {
      const auto fact = _facts.find(name);
      if (fact != _facts.end() && (!newest || fact->second.day > newest->day)) {
        newest = fact->second;
      }
    }
    return newest;
  }

 private:
  void take(std::string_view name, double value, double day) {
    if (std::isfinite(value) && value >= 0) {
      const auto [fact, isNew] = _facts.try_emplace(std::string(name), Fact{value, day});
      if (!isNew && day >= fact->second.day) {
        fact->second = {value, day};
      }
    }
  }

  void takeEvent(const std::string& name, const PageData::Event& event) {
    // The statistics magazine tells what a counter grew by, under the counter's own name.
    const std::string prefix = name.starts_with("SM.") ? name.substr(0, name.rfind('.') + 1) : "";
    if (name.starts_with("MSP")) {
      return;  // a part of the storage only
    }
    for (const auto& [field, value] : event.payload) {
      if (value.number() != nullptr) {
        take(prefix + field, value.number()->asDouble(), event.day);
      }
    }
  }

  std::map<std::string, Fact, std::less<>> _facts;
};

/// Collects the sentences; one is made when its figure is known.
struct Statements : Facts {
  using Facts::Facts;

  template <typename... Days>
  void add(HealthLevel level, const std::string& text, Days... days) {
    list.push_back({level, text, std::max({days...})});
  }

  /// A counter that should be 0.
  void addFailures(Names names, HealthLevel ifAny, const std::string& none, const char* noun,
                   const std::string& some) {
    if (const auto fact = find(names)) {
      const auto count = static_cast<std::size_t>(std::min(fact->value, 1e18));
      add(count == 0 ? HealthLevel::Good : ifAny,
          count == 0 ? none : countedNoun(count, noun) + some, fact->day);
    }
  }

  std::vector<HealthStatement> list;
};

std::string percentText(double value) { return numeral(value) + "\u202F%"; }

void addWear(Statements& statements) {
  const auto addUsed = [&statements](Names names, const char* where) {
    if (const auto used = statements.find(names)) {
      statements.add(used->value >= kWearToActOn    ? HealthLevel::Act
                     : used->value >= kWearToLookAt ? HealthLevel::Look
                                                    : HealthLevel::Good,
                     percentText(used->value) + " of the rated erase cycles of the " + where +
                         " partition are used.",
                     used->day);
    }
  };
  addUsed({"UserPartitionPEPercentUsed", "percentUsed"}, "user");
  addUsed({"IntermediatePartitionPEPercentUsed", "slcPercentUsed"}, "intermediate");
  const auto user = statements.find({"HLT_averageTLCPECycles"});
  const auto intermediate = statements.find({"HLT_averageSLCPECycles"});
  if (user && intermediate) {
    statements.add(HealthLevel::Plain,
                   "A TLC block has been erased " + numeral(user->value) +
                       " times on average, an SLC block " + numeral(intermediate->value) +
                       " times.",
                   user->day, intermediate->day);
  }
  if (const auto spare = statements.find({"spareAvailablePercent"})) {
    statements.add(spare->value <= kSpareToActOn    ? HealthLevel::Act
                   : spare->value <= kSpareToLookAt ? HealthLevel::Look
                                                    : HealthLevel::Good,
                   percentText(spare->value) + " of the spare blocks are available.", spare->day);
  }
}

void addFaults(Statements& statements) {
  const auto factory = statements.find({"numFactoryBad", "numFactoryBadBlocks"});
  const std::string since =
      factory ? "; " + numeral(factory->value) + " were bad from the factory." : ".";
  statements.addFailures({"numGrownBad"}, HealthLevel::Look, "No block has gone bad in use" + since,
                         "block", " went bad in use" + since);
  statements.addFailures({"numPfail"}, HealthLevel::Look, "No program operation has failed.",
                         "program operation", " failed.");
  statements.addFailures({"numEfail"}, HealthLevel::Look, "No erase operation has failed.",
                         "erase operation", " failed.");
  statements.addFailures({"numDieFailures"}, HealthLevel::Act, "No die has failed.", "die failure",
                         " counted.");
  statements.addFailures({"raidFailedReconstructionHost", "FailedReconstructionNonGC"},
                         HealthLevel::Act,
                         "Data that the system read has always been reconstructed.",
                         "reconstruction", " of data that the system read failed.");
  statements.addFailures({"raidFailedReconstructionInternal", "FailedReconstructionGC"},
                         HealthLevel::Act,
                         "Data that was moved internally has always been reconstructed.",
                         "reconstruction", " of data that was moved internally failed.");
  statements.addFailures({"UncleanBoots", "uncleanBoots"}, HealthLevel::Plain,
                         "No start followed an unclean shutdown.", "start",
                         " followed an unclean shutdown.");
}

void addUse(Statements& statements) {
  if (const auto full = statements.find({"HLT_OR_Diskfullness_BP"})) {
    constexpr double kBasisPoints = 100;
    const double share = full->value / kBasisPoints;
    const auto capacity = statements.find({"HLT_OR_Capacity_GB"});
    statements.add(share >= kFullnessToLookAt ? HealthLevel::Look : HealthLevel::Plain,
                   "The storage" +
                       (capacity ? " of " + numeral(capacity->value) + "\u202FGB" : "") + " is " +
                       percentText(std::round(share)) + " full.",
                   full->day);
  }
  if (const auto amplification = statements.find({"UserWamp"})) {
    statements.add(
        HealthLevel::Plain,
        "The write amplification of the user partition is " + numeral(amplification->value) + ".",
        amplification->day);
  }
  const auto written = statements.find({"hostWrites", "NumLogicalWrites", "HLT_hostWrites"});
  const auto addGrowth = [&](Names names, const char* period) {
    const auto growth = statements.find(names);
    if (growth && written && written->value > 0) {
      statements.add(HealthLevel::Plain,
                     "Writing of the last " + std::string(period) + " is " +
                         percentText(std::round(growth->value / written->value * 1e4) / 1e2) +
                         " of all that the system has ever written.",
                     growth->day);
    }
  };
  addGrowth({"SM.Daily.hostWrites"}, "day");
  addGrowth({"SM.WeeklyMA.hostWrites"}, "seven days");
  addGrowth({"SM.Monthly.hostWrites"}, "thirty days");
  if (const auto hours = statements.find({"powerOnHours", "PowerOnHours"})) {
    statements.add(HealthLevel::Plain,
                   "The storage has been powered for " + numeral(hours->value) + " hours.",
                   hours->day);
  }
}

}  // namespace

std::vector<HealthStatement> storageHealth(const PageData& data) {
  Statements statements(data);
  addWear(statements);
  addFaults(statements);
  addUse(statements);
  return std::move(statements.list);
}

}  // namespace vesprun
