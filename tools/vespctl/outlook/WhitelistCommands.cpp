#include <iostream>
#include <limits>
#include <set>

#include "Command.h"
#include "JsonObject.h"
#include "config/TBConfig.h"
#include "outlook/KeptBack.h"
#include "outlook/ReadOnlyDevice.h"
#include "outlook/WhitelistCheck.h"
#include "report/ReportSources.h"

namespace vesprun {
namespace {

void printFindings(const std::string& file) {
  std::string error;
  const auto findings = checkWhitelist(readInput(file), error);
  if (!findings) {
    throw CommandFailure(inputName(file) + ": " + error);
  }
  const auto orNull = [](const std::optional<std::string>& text) {
    return text ? std::optional<PropertyValue>(*text) : std::nullopt;
  };
  JsonArray array;
  for (const WhitelistFinding& finding : *findings) {
    array.add(JsonObject()
                  .add("group", finding.group)
                  .add("list", orNull(finding.list))
                  .add("key", orNull(finding.key))
                  .add("finding", finding.finding)
                  .add("detail", finding.detail)
                  .text());
  }
  std::cout << array.text() << '\n';
  if (!findings->empty()) {
    std::cout.flush();
    throw CommandFailure(inputName(file) + ": faults found: " + std::to_string(findings->size()));
  }
}

using Keys = std::set<std::string, std::less<>>;

/// What changes for the keys when `after` replaces `before`, which may be null.
template <typename Options>
std::string differences(const TBConfig* before, const TBConfig& after, const Keys& keys) {
  JsonArray added;
  JsonArray removed;
  JsonArray changed;
  for (const std::string& key : keys) {
    const auto from =
        before != nullptr ? before->decide<Options>(key) : WhitelistDecision<Options>();
    const auto to = after.decide<Options>(key);
    const Options* fromOptions = from.options();
    const Options* toOptions = to.options();
    if (fromOptions == nullptr && toOptions != nullptr) {
      added.add(jsonText(PropertyValue(key)));
    } else if (fromOptions != nullptr && toOptions == nullptr) {
      removed.add(jsonText(PropertyValue(key)));
    } else if (fromOptions != nullptr && *fromOptions != *toOptions) {
      changed.add(JsonObject()
                      .add("key", key)
                      .add("before", from.writtenOptions())
                      .add("after", to.writtenOptions())
                      .text());
    }
  }
  return JsonObject()
      .addText("added", added.text())
      .addText("removed", removed.text())
      .addText("changed", changed.text())
      .text();
}

void printDifferences(const std::string& directory, const std::string& file) {
  const ReadOnlyDevice opened(directory);
  const std::unique_ptr<TBConfig> after = TBConfig::fromBytes(readInput(file));
  if (!after) {
    opened.complaints.fail(inputName(file) + ": is not a whitelist");
  }
  const std::unique_ptr<TBConfig> before = TBConfig::init();
  using Days = std::numeric_limits<std::int32_t>;
  const std::vector<std::string_view> sources = ownScalarKeys();
  Keys scalars(sources.begin(), sources.end());
  Keys distributions;
  const auto take = [&](bool isDistribution, std::string_view key) {
    (isDistribution ? distributions : scalars).emplace(key);
  };
  if (!forEachRow(Days::min(), Days::max(), take)) {
    opened.complaints.fail(kUnreadableCounters);
  }
  opened.complaints.print();
  std::cout << JsonObject()
                   .addText("scalars", differences<ScalarOptions>(before.get(), *after, scalars))
                   .addText("distributions",
                            differences<DistributionOptions>(before.get(), *after, distributions))
                   .text()
            << '\n';
}

}  // namespace

void addWhitelistCommands(CLI::App& vespctl) {
  CLI::App* whitelist = vespctl.add_subcommand("whitelist", "Judges a whitelist before it is used");
  struct Arguments {
    std::string directory;
    std::string file;
  };
  const auto arguments = std::make_shared<Arguments>();

  CLI::App* check = whitelist->add_subcommand(
      "check", "Prints what is wrong or useless in it; exit status 1 when there is anything");
  check->add_option("FILE", arguments->file, "The whitelist; - for standard input")->required();
  check->callback([arguments] { printFindings(arguments->file); });

  CLI::App* diff = addDeviceCommand(
      *whitelist, "diff",
      "Prints what would leave the device, stay or change if it became the whitelist",
      arguments->directory);
  diff->add_option("FILE", arguments->file, "The whitelist; - for standard input")->required();
  diff->callback([arguments] { printDifferences(arguments->directory, arguments->file); });

  allowOneCommand(*whitelist);
}

}  // namespace vesprun
