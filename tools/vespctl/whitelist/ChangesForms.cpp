#include "whitelist/ChangesForms.h"

#include <algorithm>
#include <iostream>
#include <utility>

#include "commandline/Results.h"
#include "platform/host/documents/JsonForm.h"
#include "platform/host/documents/QuotedText.h"

namespace vesprun {
namespace {

/// What happens to an entry, in the order of the table.
constexpr const char* kWhats[] = {"added", "finer", "different", "coarser", "removed"};
constexpr std::size_t kAdded = 0;
constexpr std::size_t kFirstEffect = 1;  ///< in the order of `Effect`
constexpr std::size_t kRemoved = 4;
constexpr const char* kLetsOut[] = {"Lets more out: ", "Lets less out: ", "Lets the same out: "};

struct Row {
  std::size_t what;  ///< a place in `kWhats`
  LetsOut letsOut;
  const char* kind;
  std::string key;
  std::string before;
  std::string after;
};

void addRows(const Changes& changes, const char* kind, std::vector<Row>& rows) {
  const bool areOfDistributions = std::string_view(kind).starts_with("distribution");
  const auto text = [&](const ReadOptions& options) {
    return shortened(optionsText(options, areOfDistributions));
  };
  for (const auto& [key, options, instead, letsOut] : changes.added) {
    rows.push_back({kAdded, letsOut, kind, shortened(key), instead, text(options)});
  }
  for (const auto& change : changes.changed) {
    rows.push_back({kFirstEffect + static_cast<std::size_t>(change.effect), change.letsOut(), kind,
                    shortened(change.key), text(change.before), text(change.after)});
  }
  for (const auto& [key, options, instead, letsOut] : changes.removed) {
    rows.push_back({kRemoved, letsOut, kind, shortened(key), text(options), instead});
  }
}

/// What lets more out comes first.
std::vector<Row> rowsOf(const WhitelistChanges& changes) {
  std::vector<Row> rows;
  if (changes.areOfDocuments) {
    addRows(changes.scalars.keys, "scalar key", rows);
    addRows(changes.scalars.prefixes, "scalar prefix", rows);
    addRows(changes.distributions.keys, "distribution key", rows);
    addRows(changes.distributions.prefixes, "distribution prefix", rows);
  } else {
    addRows(changes.scalars.keys, "scalar", rows);
    addRows(changes.distributions.keys, "distribution", rows);
  }
  std::ranges::stable_sort(rows, {},
                           [](const Row& row) { return std::pair(row.letsOut, row.what); });
  return rows;
}

std::vector<std::string> remarksOf(const WhitelistChanges& changes) {
  std::vector<std::string> remarks;
  for (const auto& [kind, of] : {std::pair("Scalars: ", &changes.scalars.remarks),
                                 std::pair("Distributions: ", &changes.distributions.remarks),
                                 std::pair("", &changes.remarks)}) {
    for (const std::string& remark : *of) {
      remarks.push_back(kind + remark);
    }
  }
  return remarks;
}

/// "Lets more out: 1 added, 2 finer. Lets less out: 1 removed."
std::string summaryOf(const std::vector<Row>& rows) {
  std::uint64_t counts[std::size(kLetsOut)][std::size(kWhats)] = {};
  for (const Row& row : rows) {
    ++counts[static_cast<std::size_t>(row.letsOut)][row.what];
  }
  std::string text;
  for (std::size_t letsOut = 0; letsOut < std::size(kLetsOut); ++letsOut) {
    std::string part;
    for (std::size_t what = 0; what < std::size(kWhats); ++what) {
      if (const std::uint64_t count = counts[letsOut][what]; count > 0) {
        part.append(part.empty() ? kLetsOut[letsOut] : ", ").append(groupedDigits(count));
        part.append(" ").append(kWhats[what]);
      }
    }
    if (!part.empty()) {
      text.append(text.empty() ? "" : " ").append(part) += '.';
    }
  }
  return text.empty() ? "No entry changes what leaves." : text;
}

void appendOptions(const char* name, const ReadOptions& options, std::string& json) {
  json.append(",\"").append(name).append("\":");
  appendJsonText(options, json);
}

void appendJson(const Changes& changes, bool withOptions, std::string& json) {
  const char* separator = "";
  const auto beginItem = [&](const char* before, const std::string& key) {
    json.append(std::exchange(separator, ",")).append(before);
    appendJsonText(key, json);
  };
  const auto appendEntries = [&](const std::vector<Changes::Entry>& entries) {
    separator = "";
    for (const auto& [key, options, instead, letsOut] : entries) {
      beginItem(withOptions ? "{\"key\":" : "", key);
      if (withOptions) {
        appendOptions("options", options, json);
        json += '}';
      }
    }
  };
  json += "{\"added\":[";
  appendEntries(changes.added);
  json += "],\"removed\":[";
  appendEntries(changes.removed);
  json += "],\"changed\":[";
  separator = "";
  for (const auto& [key, before, after, effect] : changes.changed) {
    beginItem("{\"key\":", key);
    appendOptions("before", before, json);
    appendOptions("after", after, json);
    json.append(",\"effect\":\"").append(nameOf(effect)).append("\"}");
  }
  json += "]}";
}

/// As code where it is plain, else with every character that Markdown could take for markup as a
/// character reference.
std::string markdownOf(std::string_view text) {
  const auto isPlain = [](char c) {
    const auto byte = static_cast<unsigned char>(c);
    return byte >= 0x80 || std::isalnum(byte) != 0 ||
           std::string_view(" .,:-_\"()").find(c) != std::string_view::npos;
  };
  std::string result;
  for (const char c : printableText(text)) {
    if (isPlain(c)) {
      result += c;
    } else {
      result.append("&#").append(std::to_string(c)) += ';';
    }
  }
  return result;
}

std::string codeOf(std::string_view text) {
  const bool isPlain = !text.empty() && std::ranges::all_of(text, [](char c) {
    return std::isalnum(static_cast<unsigned char>(c)) != 0 ||
           std::string_view("._-:/").find(c) != std::string_view::npos;
  });
  return isPlain ? '`' + std::string(text) + '`' : "<code>" + markdownOf(text) + "</code>";
}

}  // namespace

std::string jsonText(const WhitelistChanges& changes) {
  std::string json;
  const auto appendKind = [&](const char* name, const KindChanges& kind) {
    json.append(name);
    if (!changes.areOfDocuments) {
      appendJson(kind.keys, false, json);
      return;
    }
    json += "{\"keys\":";
    appendJson(kind.keys, true, json);
    json += ",\"prefixes\":";
    appendJson(kind.prefixes, true, json);
    json += '}';
  };
  appendKind("{\"scalars\":", changes.scalars);
  appendKind(",\"distributions\":", changes.distributions);
  return json + '}';
}

void printChanges(const WhitelistChanges& changes) {
  const std::vector<Row> rows = rowsOf(changes);
  printText(summaryOf(rows));
  Table table({{"Change"}, {"Kind"}, {"Key"}, {"Before"}, {"After"}});
  for (const Row& row : rows) {
    table.addRow({kWhats[row.what], row.kind, row.key, row.before, row.after});
  }
  if (!table.empty()) {
    std::cout << '\n';
    table.print();
  }
  const std::vector<std::string> remarks = remarksOf(changes);
  std::cout << (remarks.empty() ? "" : "\n");
  for (const std::string& remark : remarks) {
    printText(remark, 2);
  }
}

void printChangesAsMarkdown(const WhitelistChanges& changes) {
  const std::vector<Row> rows = rowsOf(changes);
  std::cout << summaryOf(rows) << '\n';
  if (!rows.empty()) {
    std::cout << "\n| Change | Kind | Key | Before | After |\n|---|---|---|---|---|\n";
  }
  for (const auto& [what, letsOut, kind, key, before, after] : rows) {
    std::cout << "| " << kWhats[what] << " | " << kind << " | " << codeOf(key) << " | "
              << markdownOf(before) << " | " << markdownOf(after) << " |\n";
  }
  const std::vector<std::string> remarks = remarksOf(changes);
  std::cout << (remarks.empty() ? "" : "\n");
  for (const std::string& remark : remarks) {
    std::cout << "- " << markdownOf(remark) << '\n';
  }
}

}  // namespace vesprun
