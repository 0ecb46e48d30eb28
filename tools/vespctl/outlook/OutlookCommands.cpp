#include "outlook/OutlookCommands.h"

#include <algorithm>
#include <iostream>
#include <optional>

#include "Command.h"
#include "commandline/Arguments.h"
#include "driver/DailyTasks.h"
#include "outbox/DailyLogView.h"
#include "outlook/KeptBack.h"
#include "outlook/ReadOnlyDevice.h"
#include "report/LogSubmission.h"
#include "report/ReportSources.h"
#include "report/TBReport.h"

namespace vesprun {
namespace {

struct OutlookArguments {
  std::optional<GivenDay> day;
  bool document = false;
  bool leftOut = false;
  std::string key;
  bool isDistribution = false;
};

std::int32_t yesterday() { return dayBefore(platform().tallybook().TBDaysSince1970()); }

std::int32_t dayOf(const OutlookArguments& arguments) {
  return arguments.day ? arguments.day->on(platform().tallybook().TBDaysSince1970()) : yesterday();
}

void previewLog(const OutlookArguments& arguments) {
  const ReadOnlyDevice opened(LogLevel::Default);
  const std::int32_t day = dayOf(arguments);
  std::optional<PropertyDict> document;
  if (platform().logsmith().DiagnosticLogSubmissionEnabled()) {
    TBReport report;
    if (!report.readHistory(day)) {
      opened.complaints.fail(kUnreadableCounters);
    }
    document = report.makeDocument(day, TBReport::SideEffects::LeftOut);
    if (document && !canSerializeDailyLog(*document)) {
      document.reset();
    } else if (document && opened.device->description().submission.fails) {
      logMessage(LogLevel::Error, "%s", kSubmissionFailed);
      document.reset();
    }
  }
  opened.complaints.print();
  if (document && arguments.document) {
    platform().ptreeSerialization().serialize({*document},
                                              [](std::string_view piece) { std::cout << piece; });
  } else if (!arguments.document) {
    printResult(jsonOrNull(document), [&document] {
      if (document) {
        showDailyLog(std::cout, *document);
      } else {
        printText("Nothing would be submitted.");
      }
    });
  }
}

void printLeftOut(const OutlookArguments& arguments) {
  const ReadOnlyDevice opened(LogLevel::Default);
  const std::int32_t day = dayOf(arguments);
  const auto keys = keysKeptBack(firstDayOfReport(day), day);
  if (!keys) {
    opened.complaints.fail(kUnreadableCounters);
  }
  Json keptBack = Json::array();
  Table table({{"Kind"}, {"Key"}});
  for (const auto& [isDistribution, key] : *keys) {
    const char* const kind = isDistribution ? "distribution" : "scalar";
    keptBack.push_back({{"kind", kind}, {"key", key}});
    table.addRow({kind, key});
  }
  opened.complaints.print();
  printResult(keptBack, [&table] { table.print(); });
}

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

template <typename Options>
void explainKey(const OutlookArguments& arguments) {
  constexpr bool kIsScalar = std::is_same_v<Options, ScalarOptions>;
  const ReadOnlyDevice opened;
  const std::string_view key = arguments.key;
  const std::unique_ptr<TBConfig> config = TBConfig::init();
  WhitelistDecision<Options> decision;
  Json passedOver = Json::array();
  if (config) {
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
  Json values = Json::array();
  if (!addValues(yesterday(), key, decision.options(), values)) {
    opened.complaints.fail(kUnreadableCounters);
  }
  opened.complaints.print();
  const std::vector<std::string_view> sources = ownScalarKeys();
  const bool isSource =
      kIsScalar && std::find(sources.begin(), sources.end(), key) != sources.end();
  printResult({{"key", key},
               {"kind", kIsScalar ? "scalar" : "distribution"},
               {"leaves", decision.options() != nullptr},
               {"by", nameOf(decision.by)},
               {"prefix", decision.by == DecidedBy::Prefix ? Json(decision.prefix) : Json()},
               {"group", jsonOrNull(decision.group())},
               {"options", jsonOrNull(decision.writtenOptions())},
               {"source", isSource},
               {"passedOver", passedOver},
               {"values", values}});
}

}  // namespace

void addPreviewCommand(CLI::App& command) {
  const auto arguments = std::make_shared<OutlookArguments>();
  addDay(command, "--day", arguments->day, "The day, instead of yesterday");
  CLI::Option* document =
      command.add_flag("--document", arguments->document, "Writes the bytes of the log instead");
  document->excludes(command.get_option("--json"));
  command
      .add_flag("--left-out", arguments->leftOut,
                "Tells the keys of that day and the day before that the whitelist keeps back")
      ->excludes(document);
  command.callback([arguments] {
    if (arguments->leftOut) {
      printLeftOut(*arguments);
    } else {
      previewLog(*arguments);
    }
  });
}

void addExplainCommand(CLI::App& command) {
  const auto arguments = std::make_shared<OutlookArguments>();
  command.add_option("KEY", arguments->key, "The key of a counter")->required();
  command.add_flag("--distribution", arguments->isDistribution,
                   "The key is one of a distribution, not of a scalar");
  command.callback([arguments] {
    if (arguments->isDistribution) {
      explainKey<DistributionOptions>(*arguments);
    } else {
      explainKey<ScalarOptions>(*arguments);
    }
  });
}

}  // namespace vesprun
