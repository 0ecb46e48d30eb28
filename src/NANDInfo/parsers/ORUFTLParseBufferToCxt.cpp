#include "NANDInfo/parsers/ORUFTLParseBufferToCxt.h"

#include <algorithm>
#include <array>
#include <cstdio>
#include <optional>

#include "NANDInfo/parsers/ErrorMessages.h"
#include "NANDInfo/parsers/ORUStatKeyTable.h"
#include "NANDInfo/parsers/StatisticsRecord.h"

namespace vesprun {
namespace {

constexpr std::uint32_t kNoId = 0xFFFF;

/// The number of fields taken; empty ends the walk.
using Taken = std::optional<std::uint32_t>;

Taken takeUnknown(GenericParserCxt& ctx, const StatisticsRecordHeader& header,
                  const std::uint8_t* payload) {
  const int id = static_cast<int>(header.id);
  const int count = static_cast<int>(header.count);
  std::array<char, 32> name;
  std::snprintf(name.data(), name.size(), count > 1 ? "Stat_%d_" : "Stat_%d", id);
  if (!AddMultipleFieldsToGenericContext(ctx, name.data(), payload,
                                         StatisticsRecordReader::kWordSize, header.count)) {
    SetAPIErrorMessage("ORUFTLParseBufferToCxt %d: Cannot add %d elements to context", id, count);
    return std::nullopt;
  }
  return header.count;
}

Taken takeSingleValue(GenericParserCxt& ctx, const ORUStatKey& key, const std::uint8_t* payload) {
  if (!ctx.appendKnown(FTLNamesOf(key), payload, StatisticsRecordReader::kWordSize, 1)) {
    SetAPIErrorMessage("ORUFTLParseBufferToCxt: %s(%d) cannot add 1 element to context",
                       key.name.data(), key.id);
  }
  return 1;
}

Taken takeArray(GenericParserCxt& ctx, const ORUStatKey& key, const StatisticsRecordHeader& header,
                const std::uint8_t* payload) {
  if (header.count != key.count) {
    SetAPIErrorMessage("ORUFTLParseBufferToCxt: %s(%d): (#%d) cfg elements != (%d) buffer elements",
                       key.name.data(), key.id, key.count, static_cast<int>(header.count));
  }
  const std::uint32_t count = std::min<std::uint32_t>(header.count, key.count);
  const bool appended =
      count == 1
          ? AddSingleValueToGenericContext(ctx, key.name, "_",
                                           loadLittleEndian<std::uint64_t>(payload))
          : ctx.appendKnown(FTLNamesOf(key), payload, StatisticsRecordReader::kWordSize, count);
  if (!appended) {
    SetAPIErrorMessage("ORUFTLParseBufferToCxt: %s(%d): Cannot add %d elements to context",
                       key.name.data(), key.id, key.count);
    return std::nullopt;
  }
  return count;
}

template <typename Take>
std::uint32_t walk(GenericParserCxt& ctx, std::span<const std::uint8_t> buffer, const Take& take) {
  std::uint32_t total = 0;
  StatisticsRecordReader reader(buffer);
  ctx.reserve(reader.remaining());
  while (reader.remaining() != 0) {
    const StatisticsRecordHeader header = reader.readHeader();
    if (header.count == 0) {
      continue;
    }
    if (header.id == kNoId || !reader.holds(header)) {
      break;
    }
    const Taken taken = take(header, reader.data());
    if (!taken) {
      break;
    }
    total += *taken;
    reader.skip(header.count);
  }
  return total;
}

}  // namespace

std::uint32_t ORUFTLParseBufferToCxt(GenericParserCxt& ctx, std::span<const std::uint8_t> buffer) {
  return walk(ctx, buffer,
              [&ctx](const StatisticsRecordHeader& header, const std::uint8_t* payload) -> Taken {
                const ORUStatKey* key = findORUStatKey(header.id);
                if (key == nullptr) {
                  return takeUnknown(ctx, header, payload);
                }
                return key->isArray() ? takeArray(ctx, *key, header, payload)
                                      : takeSingleValue(ctx, *key, payload);
              });
}

std::uint32_t ORUFTLParseStatKeyBufferToCxt(GenericParserCxt& ctx,
                                            std::span<const std::uint8_t> buffer) {
  return walk(ctx, buffer,
              [&ctx](const StatisticsRecordHeader& header, const std::uint8_t* payload) {
                return takeUnknown(ctx, header, payload);
              });
}

}  // namespace vesprun
