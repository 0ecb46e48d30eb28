#include "storage/FieldsCommand.h"

#include <unistd.h>

#include <algorithm>
#include <functional>
#include <iostream>
#include <vector>

#include "NANDInfo/parsers/NandChannelCounters.h"
#include "NANDInfo/parsers/ORUMSPKeyTable.h"
#include "NANDInfo/parsers/ORUStatKeyTable.h"
#include "NANDInfo/tables/EventFields.h"
#include "NANDInfo/tables/FieldSets.h"
#include "NANDInfo/tables/LegacyKeyMap.h"
#include "NANDInfo/tables/MagazineFields.h"
#include "access/CommandDevice.h"
#include "commandline/Completion.h"
#include "platform/host/documents/QuotedText.h"
#include "platform/host/figures/FigureTable.h"

namespace vesprun {
namespace {

struct List {
  std::string name;     ///< the words that select it
  const char* columns;  ///< named on a terminal
  std::function<void()> print;
};

void printNames(const FieldTable& table) {
  table.forEach([](std::string_view name, const FieldRange&) { std::cout << name << '\n'; });
}

void printDigits(const FieldTable& table) {
  table.forEach([](std::string_view name, const FieldRange& range) {
    std::cout << name << '\t' << int{range.digits} << '\n';
  });
}

void printStatKeys() {
  for (const ORUStatKey& key : ORUStatKeyTable) {
    std::cout << key.id << '\t' << key.name << '\t' << key.count << '\n';
  }
}

void printMSPKeys() {
  for (const ORUMSPKey& key : ORUMSPKeyTable) {
    std::cout << key.key << '\t' << key.name << '\t' << key.count << '\t' << key.width() << '\n';
  }
}

void printCounterFields() {
  for (const CounterField& field : kCounterFields) {
    if (!field.name.empty()) {
      std::cout << field.first << '\t' << field.name << '\t' << field.count << '\n';
    }
  }
}

void printLegacyKeys() {
  keyMap.forEach([](std::string_view name, const FieldRange&) {
    std::cout << name << '\t' << legacyKeyOf(name).value() << '\n';
  });
}

constexpr const char* kindName(FigureKind kind) {
  return kind == FigureKind::Counter ? "counter" : kind == FigureKind::Gauge ? "gauge" : "boots";
}

void printLinuxFigures() {
  for (const LinuxFigure& figure : linuxFigures) {
    std::cout << figure.file << '\t' << figure.field << '\t' << figure.key << '\t' << figure.unit
              << '\t' << figure.divisor << '\t' << kindName(figure.kind) << '\t' << figure.why
              << '\n';
  }
}

void printLinuxDevices() {
  for (const DeviceClass& device : linuxDeviceClasses) {
    std::cout << device.name << '\t' << device.patterns << '\t' << device.namedBy << '\t'
              << device.identity << '\n';
  }
}

std::vector<List> lists() {
  std::vector<List> lists = {
      {"stat-keys", "id\tname\tcount", printStatKeys},
      {"msp-keys", "key\tname\tcount\twidth", printMSPKeys},
      {"counter-record", "first word\tname\tcount", printCounterFields},
      {"legacy-key-map", "statistic\tkey", printLegacyKeys},
      {"ftl-digits", "name\tdigits", [] { printDigits(WhitelistedRawNANDFTLCounters_SigDigDict); }},
      {"msp-digits", "name\tdigits", [] { printDigits(WhitelistedRawNANDMSPCounters_SigDigDict); }},
      {"storage-stats-digits", "name\tdigits",
       [] { printDigits(WhitelistedStorageStats_SigDigDict); }},
      {"ftl-stats-for-msp", "name", [] { printNames(FTLStats4MSPStats); }},
      {"magazine-accumulating", "name",
       [] { printNames(PrivacyApprovedSMagNANDFTLCounters_Accum); }},
      {"magazine-dynamic", "name", [] { printNames(PrivacyApprovedSMagNANDFTLCounters_Dynamic); }},
      {"linux-figures", "file\tfield\tkey\tunit\tnumber for one unit\tkind\tuse",
       printLinuxFigures},
      {"linux-devices", "name in a path\tpatterns\tnamed by\tidentity", printLinuxDevices}};
  for (const StorageEvent& event : EventHubConfigDetails) {
    lists.push_back({"event " + std::string(event.event), "name",
                     [table = event.fields] { printNames(*table); }});
  }
  return lists;
}

void printLists() {
  for (const List& list : lists()) {
    std::cout << list.name << '\n';
  }
}

void printList(const std::string& name) {
  const std::vector<List> known = lists();
  const auto list = std::ranges::find(known, name, &List::name);
  if (list == known.end()) {
    throw CLI::ValidationError(
        "LIST", "unknown list " + quotedText(name) + "; \"vespctl fields\" names them");
  }
  if (isatty(STDOUT_FILENO) != 0) {
    std::cout << "# " << list->columns << '\n';
  }
  list->print();
}

}  // namespace

void addFieldsCommand(CLI::App& command) {
  const auto words = std::make_shared<std::vector<std::string>>();
  CLI::Option* const list = command
                                .add_option("LIST", *words,
                                            "The list, or \"event\" and the name of an event; "
                                            "nothing for the names of the lists")
                                ->expected(1, 2);
  completeWith(list, [words] {
    std::vector<std::string> names;
    for (const List& known : lists()) {
      const std::size_t space = std::min(known.name.find(' '), known.name.size());
      const bool isEvent = space < known.name.size();
      if (words->empty() ? !isEvent : isEvent) {
        names.push_back(isEvent ? known.name.substr(space + 1) : known.name);
      }
    }
    if (words->empty()) {
      names.emplace_back("event");
    }
    return names;
  });
  command.callback([words] {
    if (words->empty()) {
      printLists();
    } else {
      printList(CLI::detail::join(*words, " "));
    }
  });
}

}  // namespace vesprun
