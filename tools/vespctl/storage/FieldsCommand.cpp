#include <algorithm>
#include <functional>
#include <iostream>
#include <sstream>
#include <vector>

#include "Command.h"
#include "NANDInfo/parsers/ORUMSPKeyTable.h"
#include "NANDInfo/parsers/ORUStatKeyTable.h"
#include "NANDInfo/tables/EventFields.h"
#include "NANDInfo/tables/FieldSets.h"
#include "NANDInfo/tables/LegacyKeyMap.h"
#include "NANDInfo/tables/MagazineFields.h"

namespace vesprun {
namespace {

/// The words that ask for a list, and its rows as text.
struct List {
  std::string name;
  std::function<std::string()> rows;
};

std::string statKeys() {
  std::ostringstream rows;
  for (const ORUStatKey& key : ORUStatKeyTable) {
    rows << key.id << '\t' << key.name << '\t' << key.count << '\n';
  }
  return rows.str();
}

std::string mspKeys() {
  std::ostringstream rows;
  for (const ORUMSPKey& key : ORUMSPKeyTable) {
    rows << key.key << '\t' << key.name << '\t' << key.count << '\t' << key.width() << '\n';
  }
  return rows.str();
}

std::string namesIn(const FieldTable& table) {
  std::string rows;
  table.forEach([&](std::string_view name, const FieldRange&) { rows.append(name) += '\n'; });
  return rows;
}

std::string digitsIn(const FieldTable& table) {
  std::string rows;
  table.forEach([&](std::string_view name, const FieldRange& range) {
    rows.append(name) += '\t' + std::to_string(range.digits) + '\n';
  });
  return rows;
}

std::string legacyKeys() {
  std::string rows;
  keyMap.forEach([&](std::string_view name, const FieldRange&) {
    rows.append(name) += '\t' + legacyKeyOf(name).value() + '\n';
  });
  return rows;
}

std::vector<List> lists() {
  std::vector<List> lists = {
      {"stat-keys", statKeys},
      {"msp-keys", mspKeys},
      {"legacy-key-map", legacyKeys},
      {"ftl-digits", [] { return digitsIn(WhitelistedRawNANDFTLCounters_SigDigDict); }},
      {"msp-digits", [] { return digitsIn(WhitelistedRawNANDMSPCounters_SigDigDict); }},
      {"storage-stats-digits", [] { return digitsIn(WhitelistedStorageStats_SigDigDict); }},
      {"ftl-stats-for-msp", [] { return namesIn(FTLStats4MSPStats); }},
      {"magazine-accumulating", [] { return namesIn(PrivacyApprovedSMagNANDFTLCounters_Accum); }},
      {"magazine-dynamic", [] { return namesIn(PrivacyApprovedSMagNANDFTLCounters_Dynamic); }}};
  for (const StorageEvent& event : EventHubConfigDetails) {
    lists.push_back(
        {"event " + std::string(event.event), [table = event.fields] { return namesIn(*table); }});
  }
  return lists;
}

void printLists() {
  PropertyArray names;
  for (const List& list : lists()) {
    names.emplace_back(list.name);
  }
  printJson(names);
}

void printList(const std::string& name) {
  const std::vector<List> known = lists();
  const auto list = std::ranges::find(known, name, &List::name);
  if (list == known.end()) {
    throw CLI::ValidationError("LIST", "there is no list \"" + name + '"');
  }
  std::cout << list->rows();
}

}  // namespace

void addFieldsCommand(CLI::App& vespctl) {
  CLI::App* fields = vespctl.add_subcommand("fields", "Prints the rows of a constant table");
  const auto words = std::make_shared<std::vector<std::string>>();
  fields
      ->add_option("LIST", *words,
                   "The list, or \"event\" and the name of an event; "
                   "nothing for the names of the lists")
      ->expected(1, 2);
  fields->callback([words] {
    if (words->empty()) {
      printLists();
    } else {
      printList(CLI::detail::join(*words, " "));
    }
  });
}

}  // namespace vesprun
