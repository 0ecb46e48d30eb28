#include "preview/Explanation.h"

#include <algorithm>
#include <vector>

#include "access/ReadOnlyDevice.h"
#include "commandline/Arguments.h"
#include "commandline/NearestName.h"
#include "commandline/Results.h"
#include "driver/DailyTasks.h"
#include "report/ReportSources.h"
#include "report/TBReport.h"
#include "whitelist/WhitelistDocument.h"

namespace vesprun {
namespace {

/// Adds the rows of a key that a report of `day` reads, as stored and as reported; without
/// `options` they are not reported. False when the counters cannot be read.
bool addValues(std::int32_t day, std::string_view key, const ScalarOptions* options, Json& values) {
  const auto history = platform().tallybook().initWithDefaultPath();
  return history->scalarsForKeyPrefixMinDaysSince1970MaxDaysSince1970RowHandler(
      key, firstDayOfReport(day), day,
      [&](std::string_view rowKey, std::int32_t rowDay, std::int64_t value, bool&) {
        if (rowKey != key) {
          return;
        }
        std::optional<PropertyValue> reported;
        if (options != nullptr) {
          reported = TBReport(nullptr).addScalarForKeyWithOptions(value, key, *options);
        }
        values.push_back({{"day", rowDay}, {"stored", value}, {"reported", jsonOrNull(reported)}});
      });
}

bool addValues(std::int32_t day, std::string_view key, const DistributionOptions* options,
               Json& values) {
  const auto history = platform().tallybook().initWithDefaultPath();
  return history->distributionsForKeyPrefixMinDaysSince1970MaxDaysSince1970RowHandler(
      key, firstDayOfReport(day), day,
      [&](std::string_view rowKey, std::int32_t rowDay, TBHistoryDistributionEnumerator& samples,
          bool&) {
        if (rowKey != key) {
          return;
        }
        TBReport row(nullptr);
        if (options != nullptr) {
          row.computeAndAddDistributionForKeyWithOptions(samples, key, *options);
        }
        const auto copied = [&](const PropertyDict& output) {
          const PropertyValue* value = output.find(key);
          return value != nullptr ? Json(*value) : Json();
        };
        values.push_back({{"day", rowDay},
                          {"statistics", copied(row.distributionsOutput())},
                          {"histogram", copied(row.histogramsOutput())}});
      });
}

Json nameOf(DecidedBy by) {
  switch (by) {
    case DecidedBy::Key:
      return "key";
    case DecidedBy::Prefix:
      return "prefix";
    case DecidedBy::InternalDevice:
      return "internal device";
    case DecidedBy::Nothing:
      break;
  }
  return nullptr;
}

std::string textOf(const Json& json) {
  return json.is_string() ? json.get<std::string>() : json.dump();
}

/// "group "Linux" names it", and so on.
std::string reasonOf(const Json& explanation) {
  const Json& by = explanation["by"];
  if (by.is_null()) {
    return "nothing in the whitelist lets it out";
  }
  if (by == "internal device") {
    return "this is an internal device, and nothing names it";
  }
  const std::string group = "group " + inQuotes(textOf(explanation["group"]));
  return by == "key" ? group + " names it"
                     : "it begins with the prefix " + inQuotes(textOf(explanation["prefix"])) +
                           " of " + group;
}

std::string optionsOf(const Json& explanation) {
  const bool isDistribution = explanation["kind"] == "distribution";
  std::string ignored;
  const std::optional<PropertyValue> options =
      valueFromJsonText(jsonText(explanation["options"]), ignored);
  const PropertyDict* written = options ? options->dict() : nullptr;
  if (written == nullptr) {
    return "no options";
  }
  return optionsText(
      isDistribution ? readPart<DistributionOptions>(*written) : readPart<ScalarOptions>(*written),
      isDistribution);
}

std::string valueTextOf(const Json& explanation) {
  const bool isDistribution = explanation["kind"] == "distribution";
  const Json& values = explanation["values"];
  if (values.empty()) {
    return explanation["seen"] == true
               ? "It was not counted on the last two days, so no value leaves today."
               : std::string("It was never counted as a ") +
                     (isDistribution ? "distribution." : "scalar.");
  }
  const Json& value = values.back();
  const std::string day = dateOfDay(value["day"].get<std::int32_t>());
  if (!isDistribution) {
    const std::string stored = value["stored"].dump();
    return value["reported"].is_null() ? "Counted on " + day + ": " + stored + '.'
                                       : "A report of today carries " + value["reported"].dump() +
                                             ", where " + stored + " was counted on " + day + '.';
  }
  if (value["statistics"].is_null()) {
    return "It was counted on " + day + '.';
  }
  const Json& statistics = value["statistics"];
  std::string text = "A report of today carries, of " + day + ", " + textOf(statistics[4]) +
                     " values from " + textOf(statistics[0]) + " to " + textOf(statistics[1]) +
                     ", their mean " + textOf(statistics[2]);
  if (!value["histogram"].is_null()) {
    text += ", and how many lie in";
    const char* separator = " ";
    for (const auto& [label, count] : value["histogram"].items()) {
      text.append(std::exchange(separator, ", ")).append(label).append(": ").append(count.dump());
    }
  }
  return text + '.';
}

}  // namespace

template <typename Options>
std::optional<Json> explainKey(const TBConfig* config, std::string_view key) {
  constexpr bool kIsScalar = std::is_same_v<Options, ScalarOptions>;
  WhitelistDecision<Options> decision;
  Json passedOver = Json::array();
  if (config != nullptr) {
    decision = config->decide<Options>(key);
    for (const PassedOverGroup& group : config->groupsPassedOver<Options>(key)) {
      const bool isForInternalDevices =
          group.standing == WhitelistKeyGroup::Standing::InternalDevicesOnly;
      passedOver.push_back(
          {{"group", group.name},
           {"why", isForInternalDevices ? "internal devices only" : "disabled by tasking"},
           {"by", nameOf(group.by)}});
    }
  }
  bool seen = false;
  Json values = Json::array();
  const bool isRead = forEachRow(
                          [&](bool isDistribution, std::string_view rowKey) {
                            seen = seen || (isDistribution != kIsScalar && rowKey == key);
                          },
                          key) &&
                      addValues(dayBefore(platform().tallybook().TBDaysSince1970()), key,
                                decision.options(), values);
  if (!isRead) {
    return std::nullopt;
  }
  const std::vector<std::string_view> sources = ownScalarKeys();
  return Json{{"key", key},
              {"kind", kIsScalar ? "scalar" : "distribution"},
              {"seen", seen},
              {"leaves", decision.options() != nullptr},
              {"by", nameOf(decision.by)},
              {"prefix", decision.by == DecidedBy::Prefix ? Json(decision.prefix) : Json()},
              {"group", jsonOrNull(decision.group())},
              {"options", jsonOrNull(decision.writtenOptions())},
              {"source", kIsScalar && std::ranges::find(sources, key) != sources.end()},
              {"passedOver", passedOver},
              {"values", values}};
}

template std::optional<Json> explainKey<ScalarOptions>(const TBConfig*, std::string_view);
template std::optional<Json> explainKey<DistributionOptions>(const TBConfig*, std::string_view);

void printExplanation(const Json& explanation, bool hasWhitelist) {
  const bool leaves = explanation["leaves"] == true;
  std::string text =
      "As a " + textOf(explanation["kind"]) + (leaves ? " it leaves, " : " it stays: ");
  if (leaves) {
    text += optionsOf(explanation) + ": " + reasonOf(explanation) + '.';
  } else {
    text += (hasWhitelist ? reasonOf(explanation) : "without a whitelist nothing leaves") +
            (explanation["by"].is_null() ? "." : ", but its options cannot be read.");
  }
  for (const Json& passed : explanation["passedOver"]) {
    text += " Group " + inQuotes(textOf(passed["group"])) +
            (passed["by"] == "key" ? " names it" : " has a prefix of it") +
            (passed["why"] == "disabled by tasking" ? ", but is switched off."
                                                    : ", but counts on internal devices alone.");
  }
  if (explanation["source"] == true) {
    text += " The log computes its value itself.";
  }
  printText(text + ' ' + valueTextOf(explanation), 2);
}

std::string whetherCounted(std::string_view key) {
  NearestName nearest(key);
  bool isCounted = false;
  forEachRow([&](bool, std::string_view counted) {
    isCounted = isCounted || counted == key;
    if (!isCounted) {
      nearest.take(counted);
    }
  });
  return isCounted ? ":"
         : nearest.found().empty()
             ? " was never counted, nor was any other key:"
             : " was never counted; the nearest key that was is " + inQuotes(nearest.found()) + ':';
}

}  // namespace vesprun
