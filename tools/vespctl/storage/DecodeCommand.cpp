#include "storage/DecodeCommand.h"

#include <algorithm>
#include <iostream>
#include <iterator>
#include <optional>

#include "Command.h"
#include "NANDInfo/parsers/ErrorMessages.h"
#include "NANDInfo/parsers/KernelSnapshot.h"
#include "NANDInfo/parsers/ORUFTLParseBufferToCxt.h"
#include "NANDInfo/parsers/ORUMSPParseBufferToCxt.h"
#include "NANDInfo/parsers/ORUParseBufferToCxt.h"
#include "NANDInfo/parsers/ORUStatKeyTable.h"
#include "NANDInfo/parsers/VendorCounterParsers.h"
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

struct Layout {
  const char* name;
  Json (*decode)(Buffer buffer);
  std::size_t size = 0;  ///< bytes that the file must have; 0: any number
};

constexpr Layout kLayouts[] = {
    {"base", decodeBase},
    {"ftl", decodeGeneric<ORUFTLParseBufferToCxt>},
    {"ftl-keys", decodeGeneric<ORUFTLParseStatKeyBufferToCxt>},
    {"msp", decodeGeneric<ORUMSPParseBufferToCxt>},
    {"counters-generic", decodeCounters<parseCountersAlgoGeneric>, kCounterRegionSize},
    {"counters-kx4", decodeCounters<parseCountersAlgoGenericKX4>, kCounterRegionSize},
    {"counters-1y", decodeCounters<parseCounters1y>, kCounterRegionSize},
    {"counters-1x-sandisk", decodeCounters<parseCounters1xSandisk>, kCounterRegionSize},
    {"counters-1x-hynix", decodeCounters<parseCounters1xHynix>, kCounterRegionSize},
};

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

struct DecodeArguments {
  std::string layout;
  std::string file;
  std::optional<std::string> thread;
};

std::string layouts() {
  std::string names = kSnapshot;
  for (const Layout& layout : kLayouts) {
    names.append(", ").append(layout.name);
  }
  return names;
}

/// The status tells whether there was a result.
void print(const Json& decoded) {
  printResult(decoded);
  const auto result = decoded.contains("found") ? decoded.find("found") : decoded.find("result");
  if (result != decoded.end() && (*result == false || *result == 0)) {
    invocation().status = 1;
  }
}

void decode(const DecodeArguments& arguments) {
  const bool isSnapshot = arguments.layout == kSnapshot;
  const auto* layout = std::ranges::find(kLayouts, arguments.layout, &Layout::name);
  if (layout == std::end(kLayouts) && !isSnapshot) {
    throw CLI::ValidationError(
        "LAYOUT", "there is no layout " + quotedText(arguments.layout) + "; one of " + layouts());
  }
  if (isSnapshot != arguments.thread.has_value()) {
    throw CLI::ValidationError("--thread", "goes with the layout snapshot, which needs it");
  }
  const std::string content = readInput(arguments.file);
  const Buffer buffer(reinterpret_cast<const std::uint8_t*>(content.data()), content.size());
  if (isSnapshot) {
    print(decodeSnapshot(buffer, *arguments.thread));
    return;
  }
  if (layout->size != 0 && buffer.size() != layout->size) {
    throw CommandFailure(inputName(arguments.file) + ": has " + std::to_string(buffer.size()) +
                         " bytes, not " + std::to_string(layout->size));
  }
  print(layout->decode(buffer));
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
  command.add_option("FILE", arguments->file, "The buffer; - for standard input")->required();
  command.add_option("--thread", arguments->thread, "The thread to look for in a snapshot")
      ->type_name("NAME");
  command.callback([arguments] { decode(*arguments); });
}

}  // namespace vesprun
