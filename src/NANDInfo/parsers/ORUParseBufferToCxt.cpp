#include "NANDInfo/parsers/ORUParseBufferToCxt.h"

#include <algorithm>
#include <array>

#include "NANDInfo/parsers/ORUStatKeyTable.h"
#include "NANDInfo/parsers/StatisticsRecord.h"

namespace vesprun {
namespace {

constexpr std::uint32_t kReadCountHisto = 265;

// A full record gives fewer fields than it has words. But an array that is cut short takes the
// words after it, which are read again: a buffer of headers alone could give 256 fields a word. Up
// to 1,024 words may.
constexpr std::size_t kMaxSharedFields = 1024 * 256;

/// By id; null for statistics outside the summary.
constexpr auto kSummaryFieldOfId = [] {
  std::array<const ORUSummaryField*, 57> fields{};
  for (const ORUSummaryField& field : kORUSummaryFields) {
    fields[field.id] = &field;
  }
  return fields;
}();

void keepInSummary(ORUStatsContext& ctx, std::size_t id, std::uint64_t value) {
  if (id < kSummaryFieldOfId.size() && kSummaryFieldOfId[id] != nullptr) {
    kSummaryFieldOfId[id]->set(ctx, value);
  }
}

void appendStatistic(ORUStatsContext& ctx, const ORUStatKey& key,
                     const StatisticsRecordReader& reader) {
  const std::size_t present = std::min<std::size_t>(key.count, reader.remaining());
  // A lone remaining element keeps its index, too.
  ctx.fields.appendKnown(baseNamesOf(key), reader.data(), StatisticsRecordReader::kWordSize,
                         present);
  if (!key.isArray() && present != 0) {
    keepInSummary(ctx, key.id, reader.word(0));
  }
  if (key.id == kReadCountHisto) {
    for (std::size_t i = 0; i < present; ++i) {
      ctx.readCountHisto[i] = reader.word(i);
    }
  }
}

}  // namespace

bool ORUParseBufferToCxt(ORUStatsContext& ctx, std::span<const std::uint8_t> buffer) {
  ctx.driverVersion = -1;
  StatisticsRecordReader reader(buffer);
  if (reader.remaining() == 0) {
    return false;
  }
  ctx.fields.reserve(reader.remaining());
  const std::size_t mostFields = ctx.fields.size() + std::max(reader.remaining(), kMaxSharedFields);
  do {
    const StatisticsRecordHeader header = reader.readHeader();
    if (!reader.holds(header) || ctx.fields.size() > mostFields) {
      ctx.exportVersion = 0;
      return false;
    }
    if (const ORUStatKey* key = findORUStatKey(header.id)) {
      appendStatistic(ctx, *key, reader);
    }
    reader.skip(header.count);
  } while (reader.remaining() != 0);
  return true;
}

void ORUReleaseContext(ORUStatsContext& ctx) { ctx = ORUStatsContext(); }

}  // namespace vesprun
