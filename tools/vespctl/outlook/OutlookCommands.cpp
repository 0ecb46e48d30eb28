#include <algorithm>
#include <iostream>
#include <optional>

#include "Command.h"
#include "DecimalNumber.h"
#include "JsonObject.h"
#include "driver/DailyTasks.h"
#include "outlook/KeptBack.h"
#include "outlook/ReadOnlyDevice.h"
#include "report/LogSubmission.h"
#include "report/ReportSources.h"
#include "report/TBReport.h"

namespace vesprun {
namespace {

struct OutlookArguments {
  std::string directory;
  std::optional<std::int32_t> day;
  bool document = false;
  bool leftOut = false;
  std::string key;
  bool isDistribution = false;
};

std::int32_t yesterday() { return dayBefore(platform().tallybook().TBDaysSince1970()); }

void previewLog(const OutlookArguments& arguments) {
  const ReadOnlyDevice opened(arguments.directory, LogLevel::Default);
  const std::int32_t day = arguments.day.value_or(yesterday());
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
  } else if (document) {
    printJson(*document);
  } else if (!arguments.document) {
    std::cout << "null\n";
  }
}

void printLeftOut(const OutlookArguments& arguments) {
  const ReadOnlyDevice opened(arguments.directory, LogLevel::Default);
  const std::int32_t day = arguments.day.value_or(yesterday());
  const auto keys = keysKeptBack(firstDayOfReport(day), day);
  if (!keys) {
    opened.complaints.fail(kUnreadableCounters);
  }
  JsonArray keptBack;
  for (const auto& [isDistribution, key] : *keys) {
    const char* const kind = isDistribution ? "distribution" : "scalar";
    keptBack.add(JsonObject().add("kind", kind).add("key", key).text());
  }
  opened.complaints.print();
  std::cout << keptBack.text() << '\n';
}

/// Adds the rows of a key that a report of `day` reads, as stored and as reported; without
/// `options` they are not reported. False when the counters cannot be read.
bool addValues(std::int32_t day, std::string_view key, const ScalarOptions* options,
               JsonArray& values) {
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
        values.add(
            JsonObject().add("day", rowDay).add("stored", value).add("reported", reported).text());
      });
}

bool addValues(std::int32_t day, std::string_view key, const DistributionOptions* options,
               JsonArray& values) {
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
          return value != nullptr ? std::optional(*value) : std::nullopt;
        };
        values.add(JsonObject()
                       .add("day", rowDay)
                       .add("statistics", copied(row.distributionsOutput()))
                       .add("histogram", copied(row.histogramsOutput()))
                       .text());
      });
}

std::optional<PropertyValue> nameOf(DecidedBy by) {
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
  return std::nullopt;
}

template <typename Options>
void explainKey(const OutlookArguments& arguments) {
  constexpr bool kIsScalar = std::is_same_v<Options, ScalarOptions>;
  const ReadOnlyDevice opened(arguments.directory);
  const std::string_view key = arguments.key;
  const std::unique_ptr<TBConfig> config = TBConfig::init();
  WhitelistDecision<Options> decision;
  JsonArray passedOver;
  if (config) {
    decision = config->decide<Options>(key);
    for (const PassedOverGroup& group : config->groupsPassedOver<Options>(key)) {
      const bool isForInternalDevices =
          group.standing == WhitelistKeyGroup::Standing::InternalDevicesOnly;
      passedOver.add(
          JsonObject()
              .add("group", group.name)
              .add("why", isForInternalDevices ? "internal devices only" : "disabled by tasking")
              .add("by", nameOf(group.by))
              .text());
    }
  }
  JsonArray values;
  if (!addValues(yesterday(), key, decision.options(), values)) {
    opened.complaints.fail(kUnreadableCounters);
  }
  opened.complaints.print();
  const std::vector<std::string_view> sources = ownScalarKeys();
  const bool isSource =
      kIsScalar && std::find(sources.begin(), sources.end(), key) != sources.end();
  std::optional<PropertyValue> prefix;
  if (decision.by == DecidedBy::Prefix) {
    prefix = decision.prefix;
  }
  std::cout << JsonObject()
                   .add("key", key)
                   .add("kind", kIsScalar ? "scalar" : "distribution")
                   .add("leaves", decision.options() != nullptr)
                   .add("by", nameOf(decision.by))
                   .add("prefix", prefix)
                   .add("group", decision.group())
                   .add("options", decision.writtenOptions())
                   .add("source", isSource)
                   .addText("passedOver", passedOver.text())
                   .addText("values", values.text())
                   .text()
            << '\n';
}

}  // namespace

void addOutlookCommands(CLI::App& vespctl) {
  const auto arguments = std::make_shared<OutlookArguments>();

  CLI::App* preview = addDeviceCommand(
      vespctl, "preview", "Prints the daily log that a run would submit now", arguments->directory);
  preview->add_option("--day", arguments->day, "The day number, instead of yesterday's")
      ->transform(decimal<std::int32_t>());
  CLI::Option* document =
      preview->add_flag("--document", arguments->document, "Writes the bytes of the log instead");
  preview
      ->add_flag("--left-out", arguments->leftOut,
                 "Prints the keys of that day and the day before that the whitelist keeps back")
      ->excludes(document);
  preview->callback([arguments] {
    if (arguments->leftOut) {
      printLeftOut(*arguments);
    } else {
      previewLog(*arguments);
    }
  });

  CLI::App* explain = addDeviceCommand(
      vespctl, "explain", "Says why a key leaves the device or stays", arguments->directory);
  explain->add_option("KEY", arguments->key, "The key of a counter")->required();
  explain->add_flag("--distribution", arguments->isDistribution,
                    "The key is one of a distribution, not of a scalar");
  explain->callback([arguments] {
    if (arguments->isDistribution) {
      explainKey<DistributionOptions>(*arguments);
    } else {
      explainKey<ScalarOptions>(*arguments);
    }
  });
}

}  // namespace vesprun
