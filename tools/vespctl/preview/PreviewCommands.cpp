#include "preview/PreviewCommands.h"

#include <iostream>
#include <optional>

#include "access/CommandDevice.h"
#include "access/ReadOnlyDevice.h"
#include "commandline/Arguments.h"
#include "commandline/Completion.h"
#include "driver/DailyTasks.h"
#include "outbox/DailyLogView.h"
#include "outbox/FirstReport.h"
#include "preview/Explanation.h"
#include "preview/KeptBack.h"
#include "report/LogSubmission.h"
#include "report/TBReport.h"
#include "whitelist/WhitelistDocument.h"

namespace vesprun {
namespace {

struct PreviewArguments {
  std::optional<GivenDay> day;
  bool document = false;
  bool leftOut = false;
};

std::int32_t yesterday() { return dayBefore(platform().tallybook().TBDaysSince1970()); }

std::int32_t dayOf(const PreviewArguments& arguments) {
  return arguments.day ? arguments.day->on(platform().tallybook().TBDaysSince1970()) : yesterday();
}

void previewLog(const PreviewArguments& arguments) {
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
  } else if (invocation().json) {
    std::cout << (document ? jsonText(*document) : "null") << '\n';
  } else if (document) {
    const WrappedOutput wrapped;
    showDailyLog(std::cout, *document);
  } else if (!arguments.document) {
    const std::string note = whenFirstReport(*opened.device);
    printText("Nothing would be submitted." + (note.empty() ? note : ' ' + note));
  }
}

void printLeftOut(const PreviewArguments& arguments) {
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
  printResult(keptBack, [&table] { table.printOr("No key of these two days is kept back."); });
}

struct ExplainArguments {
  std::string key;
  std::string kind;
};

void printExplanations(const ExplainArguments& arguments) {
  const ReadOnlyDevice opened;
  const std::unique_ptr<TBConfig> config = TBConfig::init();
  Json explanations = Json::array();
  const auto explain = [&]<typename Options>(Options, std::string_view kind) {
    if (arguments.kind.empty() || arguments.kind == kind) {
      const std::optional<Json> explanation = explainKey<Options>(config.get(), arguments.key);
      if (!explanation) {
        opened.complaints.fail(kUnreadableCounters);
      }
      explanations.push_back(*explanation);
    }
  };
  explain(ScalarOptions(), "scalar");
  explain(DistributionOptions(), "distribution");
  opened.complaints.print();
  printResult(arguments.kind.empty() ? explanations : explanations[0], [&] {
    printText(inQuotes(arguments.key) + whetherCounted(arguments.key));
    for (const Json& explanation : explanations) {
      printExplanation(explanation, config != nullptr);
    }
    if (const std::string note = whenFirstReport(*opened.device); !note.empty()) {
      printText(note);
    }
  });
}

}  // namespace

void addPreviewCommand(CLI::App& command) {
  const auto arguments = std::make_shared<PreviewArguments>();
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
  const auto arguments = std::make_shared<ExplainArguments>();
  completeWith(command.add_option("KEY", arguments->key, "The key of a counter")->required(),
               countedKeys);
  command.add_option("--kind", arguments->kind, "Explains it as this kind alone")
      ->type_name("scalar|distribution")
      ->check(CLI::IsMember({"scalar", "distribution"}).description(""));
  command.callback([arguments] { printExplanations(*arguments); });
}

}  // namespace vesprun
