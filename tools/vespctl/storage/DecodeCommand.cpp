#include <algorithm>
#include <iostream>
#include <iterator>
#include <optional>

#include "Command.h"
#include "JsonObject.h"
#include "NANDInfo/parsers/APIErrorMessage.h"
#include "NANDInfo/parsers/KernelSnapshot.h"
#include "NANDInfo/parsers/ORUFTLParseBufferToCxt.h"
#include "NANDInfo/parsers/ORUMSPParseBufferToCxt.h"
#include "NANDInfo/parsers/ORUParseBufferToCxt.h"
#include "NANDInfo/parsers/ORUStatKeyTable.h"
#include "NANDInfo/parsers/VendorCounterParsers.h"
#include "common/LittleEndian.h"

namespace vesprun {
namespace {

using Buffer = std::span<const std::uint8_t>;

/// Field by field: there can be a million. Names need no JSON escapes.
void printFields(const PropertyValue& result, const GenericParserCxt& fields) {
  std::cout << "{\"result\":" << jsonText(result)
            << ",\"error\":" << jsonText(PropertyValue(GetAPIErrorMessage())) << ",\"fields\":[";
  const char* separator = "";
  fields.forEach([&separator](const GenericParserCxt::Field& field) {
    std::cout << separator << "[\"" << field.name << "\"," << field.value << ']';
    separator = ",";
  });
  std::cout << ']';
}

void decodeBase(Buffer buffer) {
  ORUStatsContext ctx;
  const bool result = ORUParseBufferToCxt(ctx, buffer);
  PropertyDict summary;
  for (const ORUSummaryField& field : kORUSummaryFields) {
    summary.set(findORUStatKey(field.id)->name, field.get(ctx));
    if (field.narrow == &ORUStatsContext::exportVersion) {
      summary.set("driverVersion", ctx.driverVersion);
    }
  }
  summary.set("readCountHisto",
              PropertyArray(ctx.readCountHisto.begin(), ctx.readCountHisto.end()));
  printFields(result, ctx.fields);
  std::cout << ",\"summary\":" << jsonText(summary) << "}\n";
}

template <auto parse>
void decodeGeneric(Buffer buffer) {
  GenericParserCxt ctx;
  const std::uint32_t result = parse(ctx, buffer);
  printFields(result, ctx);
  std::cout << "}\n";
}

template <auto parse>
void decodeCounters(Buffer buffer) {
  NandChannelCounters counters{};
  parse(buffer.first<kCounterRegionSize>(), counters);
  printJson(PropertyDict{{"words", PropertyArray(counters.begin(), counters.end())}});
}

struct Layout {
  const char* name;
  void (*decode)(Buffer buffer);
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

/// Prints the whole 64-bit words of the thread's statistics.
void printSnapshot(Buffer snapshot, const std::string& thread) {
  std::optional<Buffer> statistics;
  const bool found = getIOStatsWithThreadnameFromSnapData(snapshot, thread.c_str(), statistics);
  std::optional<PropertyValue> words;
  if (statistics) {
    PropertyArray array;
    for (Buffer rest = *statistics; rest.size() >= sizeof(std::uint64_t);
         rest = rest.subspan(sizeof(std::uint64_t))) {
      array.emplace_back(loadLittleEndian<std::uint64_t>(rest.data()));
    }
    words = std::move(array);
  }
  std::cout << JsonObject().add("found", found).add("ioStatistics", words).text() << '\n';
}

struct Arguments {
  std::string layout;
  std::string file;
  std::optional<std::string> thread;
};

void decode(const Arguments& arguments) {
  const bool isSnapshot = arguments.layout == kSnapshot;
  const auto* layout = std::ranges::find(kLayouts, arguments.layout, &Layout::name);
  if (layout == std::end(kLayouts) && !isSnapshot) {
    throw CLI::ValidationError("LAYOUT", "there is no layout " + arguments.layout);
  }
  if (isSnapshot != arguments.thread.has_value()) {
    throw CLI::ValidationError("--thread", "goes with the layout snapshot, which needs it");
  }
  const std::string content = readInput(arguments.file);
  const Buffer buffer(reinterpret_cast<const std::uint8_t*>(content.data()), content.size());
  if (isSnapshot) {
    printSnapshot(buffer, *arguments.thread);
    return;
  }
  if (layout->size != 0 && buffer.size() != layout->size) {
    throw CommandFailure(inputName(arguments.file) + ": has " + std::to_string(buffer.size()) +
                         " bytes, not " + std::to_string(layout->size));
  }
  layout->decode(buffer);
}

}  // namespace

void addDecodeCommand(CLI::App& vespctl) {
  const auto arguments = std::make_shared<Arguments>();
  std::string layouts = kSnapshot;
  for (const Layout& layout : kLayouts) {
    layouts.append(", ").append(layout.name);
  }
  CLI::App* command = vespctl.add_subcommand("decode", "Decodes one saved buffer of the device");
  command->add_option("LAYOUT", arguments->layout, "What the buffer is: " + layouts)->required();
  command->add_option("FILE", arguments->file, "The buffer; - for standard input")->required();
  command->add_option("--thread", arguments->thread, "The thread to look for in a snapshot");
  command->callback([arguments] { decode(*arguments); });
}

}  // namespace vesprun
