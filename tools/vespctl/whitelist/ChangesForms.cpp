#include "whitelist/ChangesForms.h"

#include <algorithm>
#include <iostream>

#include "commandline/Results.h"
#include "platform/host/documents/QuotedText.h"

namespace vesprun {
namespace {

/// What happens to an entry; what lets more out comes first.
constexpr const char* kWhats[] = {"added", "finer", "different", "coarser", "removed"};
constexpr std::size_t kWhatsThatReveal = 3;

struct Row {
  std::string_view what;
  const char* kind;
  std::string key;
  std::string before;
  std::string after;
};

void addRows(const Changes& changes, const char* kind, const WhitelistChanges& all,
             std::vector<Row>& rows) {
  const bool areOfDistributions = std::string_view(kind).starts_with("distribution");
  const auto text = [&](const PropertyDict& options) {
    return shortened(optionsText(options, areOfDistributions));
  };
  const auto without = [&all](const std::string& note) {
    const char* const nothing = all.areOfDocuments ? "no entry" : "stays";
    return note.empty() ? nothing : std::string(nothing) + ", " + note;
  };
  for (const auto& [key, options, note] : changes.added) {
    rows.push_back({"added", kind, shortened(key), without(note), text(options)});
  }
  for (const auto& [key, before, after, effect] : changes.changed) {
    rows.push_back({nameOf(effect), kind, shortened(key), text(before), text(after)});
  }
  for (const auto& [key, options, note] : changes.removed) {
    rows.push_back({"removed", kind, shortened(key), text(options), without(note)});
  }
}

std::vector<Row> rowsOf(const WhitelistChanges& changes) {
  std::vector<Row> rows;
  if (changes.areOfDocuments) {
    addRows(changes.scalars.keys, "scalar key", changes, rows);
    addRows(changes.scalars.prefixes, "scalar prefix", changes, rows);
    addRows(changes.distributions.keys, "distribution key", changes, rows);
    addRows(changes.distributions.prefixes, "distribution prefix", changes, rows);
  } else {
    addRows(changes.scalars.keys, "scalar", changes, rows);
    addRows(changes.distributions.keys, "distribution", changes, rows);
  }
  std::ranges::stable_sort(rows, {}, [](const Row& row) {
    return std::ranges::find(kWhats, row.what) - std::begin(kWhats);
  });
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
  std::string text;
  std::string part;
  for (std::size_t i = 0; i < std::size(kWhats); ++i) {
    const auto count = std::ranges::count(rows, kWhats[i], &Row::what);
    if (count > 0) {
      part.append(part.empty() ? "" : ", ")
          .append(groupedDigits(static_cast<std::uint64_t>(count)));
      part.append(" ").append(kWhats[i]);
    }
    const bool isEnd = i + 1 == kWhatsThatReveal || i + 1 == std::size(kWhats);
    if (isEnd && !part.empty()) {
      text.append(text.empty() ? "" : " ");
      text.append(i < kWhatsThatReveal ? "Lets more out: " : "Lets less out: ").append(part) += '.';
      part.clear();
    }
  }
  return text.empty() ? "No entry changes what leaves." : text;
}

Json jsonOf(const Changes& changes, bool withOptions) {
  const auto entries = [withOptions](const std::vector<Changes::Entry>& list) {
    Json array = Json::array();
    for (const auto& [key, options, note] : list) {
      array.push_back(withOptions ? Json{{"key", key}, {"options", options}} : Json(key));
    }
    return array;
  };
  Json changed = Json::array();
  for (const auto& [key, before, after, effect] : changes.changed) {
    changed.push_back(
        {{"key", key}, {"before", before}, {"after", after}, {"effect", nameOf(effect)}});
  }
  return {{"added", entries(changes.added)},
          {"removed", entries(changes.removed)},
          {"changed", std::move(changed)}};
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
    result += isPlain(c) ? std::string(1, c) : "&#" + std::to_string(c) + ';';
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

Json jsonOf(const WhitelistChanges& changes) {
  const auto ofKind = [&changes](const KindChanges& kind) {
    return changes.areOfDocuments
               ? Json{{"keys", jsonOf(kind.keys, true)}, {"prefixes", jsonOf(kind.prefixes, true)}}
               : jsonOf(kind.keys, false);
  };
  return {{"scalars", ofKind(changes.scalars)}, {"distributions", ofKind(changes.distributions)}};
}

void printChanges(const WhitelistChanges& changes) {
  const std::vector<Row> rows = rowsOf(changes);
  printText(summaryOf(rows));
  Table table({{"Change"}, {"Kind"}, {"Key"}, {"Before"}, {"After"}});
  for (const Row& row : rows) {
    table.addRow({std::string(row.what), row.kind, row.key, row.before, row.after});
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
  for (const auto& [what, kind, key, before, after] : rows) {
    std::cout << "| " << what << " | " << kind << " | " << codeOf(key) << " | "
              << markdownOf(before) << " | " << markdownOf(after) << " |\n";
  }
  const std::vector<std::string> remarks = remarksOf(changes);
  std::cout << (remarks.empty() ? "" : "\n");
  for (const std::string& remark : remarks) {
    std::cout << "- " << markdownOf(remark) << '\n';
  }
}

}  // namespace vesprun
