#include "storage/DecodeCommand.h"

#include <algorithm>
#include <iostream>
#include <iterator>
#include <map>
#include <optional>
#include <vector>

#include "NANDInfo/parsers/ErrorMessages.h"
#include "NANDInfo/parsers/KernelSnapshot.h"
#include "NANDInfo/parsers/MSPRecord.h"
#include "NANDInfo/parsers/ORUFTLParseBufferToCxt.h"
#include "NANDInfo/parsers/ORUMSPKeyTable.h"
#include "NANDInfo/parsers/ORUMSPParseBufferToCxt.h"
#include "NANDInfo/parsers/ORUParseBufferToCxt.h"
#include "NANDInfo/parsers/ORUStatKeyTable.h"
#include "NANDInfo/parsers/StatisticsRecord.h"
#include "NANDInfo/parsers/VendorCounterParsers.h"
#include "access/CommandDevice.h"
#include "commandline/Completion.h"
#include "common/LittleEndian.h"
#include "platform/host/documents/QuotedText.h"

namespace vesprun {
namespace {

using Buffer = std::span<const std::uint8_t>;

Json fieldsOf(const GenericParserCxt& fields) {
  Json array = Json::array();
  fields.forEach([&array](const GenericParserCxt::Field& field) {
    array.push_back(Json::array({field.name, field.value}));
  });
  return array;
}

Json decodeBase(Buffer buffer) {
  ORUStatsContext ctx;
  const bool result = ORUParseBufferToCxt(ctx, buffer);
  Json summary;
  for (const ORUSummaryField& field : kORUSummaryFields) {
    summary[std::string(findORUStatKey(field.id)->name)] = field.get(ctx);
    if (field.narrow == &ORUStatsContext::exportVersion) {
      summary["driverVersion"] = ctx.driverVersion;
    }
  }
  summary["readCountHisto"] = ctx.readCountHisto;
  return {{"result", result},
          {"error", GetAPIErrorMessage()},
          {"fields", fieldsOf(ctx.fields)},
          {"summary", std::move(summary)}};
}

template <auto parse>
Json decodeGeneric(Buffer buffer) {
  GenericParserCxt ctx;
  const std::uint32_t result = parse(ctx, buffer);
  return {{"result", result}, {"error", GetAPIErrorMessage()}, {"fields", fieldsOf(ctx)}};
}

template <auto parse>
Json decodeCounters(Buffer buffer) {
  NandChannelCounters counters{};
  parse(buffer.first<kCounterRegionSize>(), counters);
  return {{"words", counters}};
}

constexpr const char* kSnapshot = "snapshot";

/// The whole 64-bit words of the thread's statistics.
Json decodeSnapshot(Buffer snapshot, const std::string& thread) {
  std::optional<Buffer> statistics;
  const bool found = getIOStatsWithThreadnameFromSnapData(snapshot, thread.c_str(), statistics);
  Json words;
  if (statistics) {
    words = Json::array();
    for (Buffer rest = *statistics; rest.size() >= sizeof(std::uint64_t);
         rest = rest.subspan(sizeof(std::uint64_t))) {
      words.push_back(loadLittleEndian<std::uint64_t>(rest.data()));
    }
  }
  return {{"found", found}, {"ioStatistics", std::move(words)}};
}

/// Adds up what a parser of records passes over.
class Undecoded {
 public:
  void pass(std::size_t bytes) {
    _passed += bytes;
    _records += bytes != 0 ? 1U : 0U;
  }
  void end(std::size_t offset, std::size_t bytes, std::string why) {
    _rest = std::to_string(bytes) + " bytes from offset " + std::to_string(offset) + " on: " + why;
  }

  /// For people, about a buffer of that size.
  std::string text(std::size_t size) const {
    std::string text;
    if (_passed != 0) {
      text = std::to_string(_passed) + " bytes in " + std::to_string(_records) +
             " records that have no name here, or more values than are known";
    }
    if (!_rest.empty()) {
      text += (text.empty() ? "" : "; ") + _rest;
    }
    return text.empty() ? "All of the " + std::to_string(size) + " bytes were decoded."
                        : "Not decoded of " + std::to_string(size) + " bytes: " + text + '.';
  }

 private:
  std::size_t _passed = 0;
  std::size_t _records = 0;
  std::string _rest;
};

std::string claim(std::size_t claimed, std::size_t left, const char* unit) {
  return "a record claims " + std::to_string(claimed) + ' ' + unit + ", and " +
         std::to_string(left) + " follow";
}

enum class NamedBy { Base, FTL, None };

template <NamedBy names>
Undecoded passedOverStatistics(Buffer buffer) {
  constexpr std::uint32_t kEndOfFTL = 0xFFFF;
  constexpr std::size_t kWord = StatisticsRecordReader::kWordSize;
  Undecoded undecoded;
  StatisticsRecordReader reader(buffer);
  const std::size_t whole = reader.remaining() * kWord;
  while (reader.remaining() != 0) {
    const std::size_t offset = whole - reader.remaining() * kWord;
    const StatisticsRecordHeader header = reader.readHeader();
    if (header.count == 0 && names != NamedBy::Base) {
      continue;
    }
    const bool isEnd = names != NamedBy::Base && header.id == kEndOfFTL;
    if (isEnd || !reader.holds(header)) {
      undecoded.end(offset, buffer.size() - offset,
                    isEnd ? "the records end there"
                    : header.id > StatisticsRecordHeader::kMaxId
                        ? "no record begins there"
                        : claim(header.count, reader.remaining(), "words"));
      return undecoded;
    }
    const ORUStatKey* const key = names == NamedBy::None ? nullptr : findORUStatKey(header.id);
    if (key != nullptr) {
      undecoded.pass((header.count - std::min<std::size_t>(header.count, key->count)) * kWord);
    } else if (names == NamedBy::Base) {
      undecoded.pass((1 + std::size_t{header.count}) * kWord);
    }
    reader.skip(header.count);
  }
  if (whole != buffer.size()) {
    undecoded.end(whole, buffer.size() - whole, "too few for a word");
  }
  return undecoded;
}

Undecoded passedOverMSP(Buffer buffer) {
  Undecoded undecoded;
  MSPRecordReader reader(buffer);
  std::size_t offset = 0;
  while (reader.holdsHeader()) {
    const MSPRecordHeader header = reader.readHeader();
    const std::size_t left = buffer.size() - offset - MSPRecordHeader::kSize;
    const bool isEnd = header.length != 0 && header.key == MSPRecordHeader::kEndMarker;
    if (isEnd || !reader.holds(header)) {
      undecoded.end(offset, buffer.size() - offset,
                    isEnd ? "the records end there" : claim(header.length, left, "bytes"));
      return undecoded;
    }
    reader.read(header.length);
    const ORUMSPKey* const key = findORUMSPKey(header.key);
    if (key == nullptr) {
      undecoded.pass(header.length == 0 ? 0 : MSPRecordHeader::kSize + header.length);
    } else {
      const std::size_t read =
          std::min<std::size_t>(std::size_t{header.length} / key->width(), key->count) *
          key->width();
      undecoded.pass(header.length - read);
    }
    offset += MSPRecordHeader::kSize + header.length;
  }
  if (offset != buffer.size()) {
    undecoded.end(offset, buffer.size() - offset, "too few for a record");
  }
  return undecoded;
}

struct Layout {
  const char* name;
  Json (*decode)(Buffer buffer);
  Undecoded (*passedOver)(Buffer buffer) = nullptr;  ///< of the layouts with fields
  std::size_t size = 0;                              ///< bytes of the file; 0: any number
};

constexpr Layout kLayouts[] = {
    {"base", decodeBase, passedOverStatistics<NamedBy::Base>},
    {"ftl", decodeGeneric<ORUFTLParseBufferToCxt>, passedOverStatistics<NamedBy::FTL>},
    {"ftl-keys", decodeGeneric<ORUFTLParseStatKeyBufferToCxt>, passedOverStatistics<NamedBy::None>},
    {"msp", decodeGeneric<ORUMSPParseBufferToCxt>, passedOverMSP},
    {"counters-generic", decodeCounters<parseCountersAlgoGeneric>, nullptr, kCounterRegionSize},
    {"counters-kx4", decodeCounters<parseCountersAlgoGenericKX4>, nullptr, kCounterRegionSize},
    {"counters-1y", decodeCounters<parseCounters1y>, nullptr, kCounterRegionSize},
    {"counters-1x-sandisk", decodeCounters<parseCounters1xSandisk>, nullptr, kCounterRegionSize},
    {"counters-1x-hynix", decodeCounters<parseCounters1xHynix>, nullptr, kCounterRegionSize},
};

/// What differs between the fields of two buffers, by name and place among those of that name, in
/// the order of the first; then what only the second has.
Json differencesOf(const Json& before, const Json& after) {
  using Place = std::pair<std::string, std::size_t>;
  const auto placesOf = [](const Json& fields) {
    std::map<std::string, std::size_t> seen;
    std::vector<std::pair<Place, Json>> places;
    for (const Json& field : fields) {
      const auto name = field[0].get<std::string>();
      places.emplace_back(Place(name, seen[name]++), field[1]);
    }
    return places;
  };
  const auto first = placesOf(before);
  const auto second = placesOf(after);
  const std::map<Place, Json> inFirst(first.begin(), first.end());
  const std::map<Place, Json> inSecond(second.begin(), second.end());
  Json differences = Json::array();
  for (const auto& [place, value] : first) {
    const auto other = inSecond.find(place);
    const Json now = other != inSecond.end() ? other->second : Json();
    if (now != value) {
      differences.push_back({{"field", place.first}, {"before", value}, {"after", now}});
    }
  }
  for (const auto& [place, value] : second) {
    if (!inFirst.contains(place)) {
      differences.push_back({{"field", place.first}, {"before", nullptr}, {"after", value}});
    }
  }
  return differences;
}

struct DecodeArguments {
  std::string layout;
  std::vector<std::string> files;
  std::optional<std::string> thread;
};

std::string layouts() {
  std::string names = kSnapshot;
  for (const Layout& layout : kLayouts) {
    names.append(", ").append(layout.name);
  }
  return names;
}

Buffer bufferOf(const std::string& content) {
  return {reinterpret_cast<const std::uint8_t*>(content.data()), content.size()};
}

/// The status tells whether there was a result.
void print(const Json& decoded) {
  printResult(decoded);
  const auto result = decoded.contains("found") ? decoded.find("found") : decoded.find("result");
  if (result != decoded.end() && (*result == false || *result == 0)) {
    invocation().status = 1;
  }
}

void compareFields(const Layout& layout, const std::vector<std::string>& files) {
  const std::string before = readInput(files[0]);
  const std::string after = readInput(files[1]);
  const Json differences = differencesOf(layout.decode(bufferOf(before))["fields"],
                                         layout.decode(bufferOf(after))["fields"]);
  printResult(differences, [&] {
    Table table({{"Field"}, {"Before", Table::Align::Right}, {"After", Table::Align::Right}});
    const auto text = [](const Json& value) { return value.is_null() ? "-" : value.dump(); };
    for (const Json& line : differences) {
      table.addRow({line["field"].get<std::string>(), text(line["before"]), text(line["after"])});
    }
    table.printOr("The fields of both are the same.");
  });
}

void decode(const DecodeArguments& arguments) {
  const bool isSnapshot = arguments.layout == kSnapshot;
  const auto* layout = std::ranges::find(kLayouts, arguments.layout, &Layout::name);
  if (layout == std::end(kLayouts) && !isSnapshot) {
    throw CLI::ValidationError(
        "LAYOUT", "unknown layout " + quotedText(arguments.layout) + "; one of " + layouts());
  }
  if (isSnapshot != arguments.thread.has_value()) {
    throw CLI::ValidationError("--thread", "goes with the layout snapshot, which needs it");
  }
  if (arguments.files.size() > 1) {
    if (isSnapshot || layout->passedOver == nullptr) {
      throw CLI::ValidationError("FILE",
                                 "two are compared of the layouts base, ftl, ftl-keys and msp");
    }
    compareFields(*layout, arguments.files);
    return;
  }
  const std::string& file = arguments.files.front();
  const std::string content = readInput(file);
  const Buffer buffer = bufferOf(content);
  if (isSnapshot) {
    print(decodeSnapshot(buffer, *arguments.thread));
    return;
  }
  if (layout->size != 0 && buffer.size() != layout->size) {
    throw CommandFailure(inputName(file) + ": has " + std::to_string(buffer.size()) +
                         " bytes, not " + std::to_string(layout->size));
  }
  print(layout->decode(buffer));
  if (layout->passedOver != nullptr && !invocation().json) {
    std::cout << '\n';
    printText(layout->passedOver(buffer).text(buffer.size()));
  }
}

}  // namespace

void addDecodeCommand(CLI::App& command) {
  const auto arguments = std::make_shared<DecodeArguments>();
  CLI::Option* const layout =
      command.add_option("LAYOUT", arguments->layout, "What the buffer is: " + layouts())
          ->required();
  completeWith(layout, [] {
    std::vector<std::string> names{kSnapshot};
    for (const Layout& known : kLayouts) {
      names.emplace_back(known.name);
    }
    return names;
  });
  command
      .add_option("FILE", arguments->files,
                  "The buffer, - for standard input; with a second one, what differs")
      ->required()
      ->expected(1, 2);
  command.add_option("--thread", arguments->thread, "The thread to look for in a snapshot")
      ->type_name("NAME");
  command.callback([arguments] { decode(*arguments); });
}

}  // namespace vesprun
