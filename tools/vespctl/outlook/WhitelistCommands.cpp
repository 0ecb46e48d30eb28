#include "outlook/WhitelistCommands.h"

#include <limits>
#include <set>

#include "Command.h"
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
  Json array = Json::array();
  Table table({{"Finding"}, {"Group"}, {"List"}, {"Key"}, {"What to do"}});
  for (const WhitelistFinding& finding : *findings) {
    array.push_back({{"group", finding.group},
                     {"list", jsonOrNull(finding.list)},
                     {"key", jsonOrNull(finding.key)},
                     {"finding", finding.finding},
                     {"detail", finding.detail}});
    table.addRow({finding.finding, finding.group, finding.list.value_or(""),
                  finding.key.value_or(""), finding.detail});
  }
  printResult(array, [&table] { table.print(); });
  invocation().status = findings->empty() ? 0 : 1;
}

using Keys = std::set<std::string, std::less<>>;

/// What changes for the keys when `after` replaces `before`, which may be null.
template <typename Options>
Json differences(const TBConfig* before, const TBConfig& after, const Keys& keys) {
  Json added = Json::array();
  Json removed = Json::array();
  Json changed = Json::array();
  for (const std::string& key : keys) {
    const auto from =
        before != nullptr ? before->decide<Options>(key) : WhitelistDecision<Options>();
    const auto to = after.decide<Options>(key);
    const Options* fromOptions = from.options();
    const Options* toOptions = to.options();
    if (fromOptions == nullptr && toOptions != nullptr) {
      added.push_back(key);
    } else if (fromOptions != nullptr && toOptions == nullptr) {
      removed.push_back(key);
    } else if (fromOptions != nullptr && *fromOptions != *toOptions) {
      changed.push_back({{"key", key},
                         {"before", jsonOrNull(from.writtenOptions())},
                         {"after", jsonOrNull(to.writtenOptions())}});
    }
  }
  return {{"added", std::move(added)},
          {"removed", std::move(removed)},
          {"changed", std::move(changed)}};
}

void printDifferences(const std::string& file) {
  const std::string bytes = readInput(file);
  const ReadOnlyDevice opened;
  const std::unique_ptr<TBConfig> after = TBConfig::fromBytes(bytes);
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
  printResult(
      {{"scalars", differences<ScalarOptions>(before.get(), *after, scalars)},
       {"distributions", differences<DistributionOptions>(before.get(), *after, distributions)}});
}

void addCheck(CLI::App& command) {
  const auto file = std::make_shared<std::string>();
  command.add_option("FILE", *file, "The whitelist; - for standard input")->required();
  command.callback([file] { printFindings(*file); });
}

void addDiff(CLI::App& command) {
  const auto file = std::make_shared<std::string>();
  command.add_option("NEW", *file, "The whitelist; - for standard input")->required();
  command.callback([file] { printDifferences(*file); });
}

constexpr Command kWhitelistCommands[] = {
    {"check", "Tells what is wrong or useless in it; exit status 1 when there is anything",
     addCheck},
    {"diff", "Tells what would leave the device, stay or change if it became the whitelist",
     addDiff},
};

}  // namespace

void addWhitelistCommands(CLI::App& command) { addCommands(command, kWhitelistCommands); }

}  // namespace vesprun
