#include "NANDInfo/parsers/ORUMSPParseBufferToCxt.h"

#include <algorithm>

#include "NANDInfo/parsers/ErrorMessages.h"
#include "NANDInfo/parsers/MSPRecord.h"
#include "NANDInfo/parsers/ORUMSPKeyTable.h"

namespace vesprun {
namespace {

/// Adds the elements that both payload and statistic have. False when memory runs out.
bool take(GenericParserCxt& ctx, const ORUMSPKey& key, std::span<const std::uint8_t> payload,
          std::uint32_t& total) {
  const auto size = static_cast<std::uint32_t>(payload.size());
  if (size != key.size()) {
    SetAPIErrorMessage(
        "ORUMSPParseBufferToCxt: %s(%d): cfg %d elements; (%d*%d) cfg bytes != (%d) buffer bytes",
        key.name.data(), key.key, key.count, key.count, static_cast<int>(key.width()),
        static_cast<int>(size));
  }
  const std::uint32_t count = std::min<std::uint32_t>(size / key.width(), key.count);
  // The lone element that is left of an array is named as a single value.
  const bool appended = count == 1 && key.count > 1
                            ? AddSingleValueToGenericContext(
                                  ctx, "", key.name, loadLittleEndian(payload.data(), key.width()))
                            : ctx.appendKnown(MSPNamesOf(key), payload.data(), key.width(), count);
  if (!appended) {
    SetAPIErrorMessage("ORUMSPParseBufferToCxt: %s(%d): Error adding %d elements to context",
                       key.name.data(), key.key, key.count);
    return false;
  }
  total += count;
  return true;
}

}  // namespace

std::uint32_t ORUMSPParseBufferToCxt(GenericParserCxt& ctx, std::span<const std::uint8_t> buffer) {
  if (buffer.empty()) {
    SetAPIErrorMessage("ORUMSPParseBufferToCxt: Passed in invalid buffer or empty buffer");
    return 0;
  }
  std::uint32_t total = 0;
  MSPRecordReader reader(buffer);
  while (reader.holdsHeader()) {
    const MSPRecordHeader header = reader.readHeader();
    // Even an end marker needs a payload.
    if (header.length == 0) {
      continue;
    }
    if (header.key == MSPRecordHeader::kEndMarker || !reader.holds(header)) {
      break;
    }
    const std::span<const std::uint8_t> payload = reader.read(header.length);
    const ORUMSPKey* key = findORUMSPKey(header.key);
    if (key != nullptr && !take(ctx, *key, payload, total)) {
      break;
    }
  }
  return total;
}

}  // namespace vesprun
