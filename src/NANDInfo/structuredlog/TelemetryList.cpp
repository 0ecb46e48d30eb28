#include "NANDInfo/structuredlog/TelemetryList.h"

#include <algorithm>
#include <array>
#include <cctype>
#include <cstddef>
#include <cstdio>
#include <memory>
#include <new>
#include <optional>
#include <string>

#include "NANDInfo/parsers/VendorCounterParsers.h"
#include "NANDInfo/structuredlog/StructuredLog.h"
#include "common/LittleEndian.h"
#include "platform/DictionaryHelpers.h"
#include "platform/Platform.h"

namespace vesprun {
namespace {

// For B buses: B counter regions, then B bus entries.
constexpr std::size_t kWordSize = 4;
constexpr std::size_t kBusEntrySize = 32;
constexpr std::uint64_t kBytesPerBus = kCounterRegionSize + kBusEntrySize;

/// The words of a bus entry; the last one is unused.
constexpr std::array<const char*, 7> kBusEntryKeys{"RD",  "PE",         "Max_PE_rate", "t0",
                                                   "Ret", "block_type", "num_pages"};
static_assert((kBusEntryKeys.size() + 1) * kWordSize == kBusEntrySize);

/// What depends on the flash in use.
struct CounterLayout {
  void (*parse)(CounterRegion, NandChannelCounters&);
  std::size_t readStages = 23;
  std::size_t dspParameters = 12;
  CounterFieldId chipsOwnBins = CounterFieldId::NotUsed;

  /// Logged elements of a field.
  std::size_t count(CounterFieldId id) const {
    switch (id) {
      case CounterFieldId::ReadStage:
        return readStages;
      case CounterFieldId::DspExceptionParameter:
        return dspParameters;
      case CounterFieldId::NotUsed:
        return 0;
      case CounterFieldId::AlgoNANDAccessesBin:
      case CounterFieldId::RetentionIndication:
        return id == chipsOwnBins ? counterField(id).count : 0;
      default:
        return counterField(id).count;
    }
  }
};

struct Characteristics {
  CounterLayout layout;
  std::int32_t busCount;
};

/// Four hexadecimal digits, then eight, the last two of which are ignored.
std::uint64_t manufacturerKey(std::string_view text) {
  constexpr std::uint32_t kVendorDigits = 4;
  constexpr std::uint32_t kPartDigits = 8;
  const std::string_view vendor = text.substr(0, kVendorDigits);
  const std::string_view part = text.substr(vendor.size());
  const std::uint64_t vendorCode = hexStringToInt32(vendor, kVendorDigits) & 0xFFFF;
  return vendorCode << 32 | (hexStringToInt32(part, kPartDigits) & 0xFFFFFF00);
}

CounterLayout vendorLayout(std::uint64_t manufacturer) {
  switch (manufacturer) {
    case 0x4582603A5700:
    case 0x458260DE5700:
      return {parseCounters1xSandisk};
    case 0xAD8252232100:
      return {parseCounters1xHynix};
    default:
      return {parseCounters1y};
  }
}

CounterLayout counterLayout(std::string_view chip, std::string_view manufacturer) {
  const std::uint64_t key = manufacturerKey(manufacturer);
  if (chip == "KX3") {
    return {parseCountersAlgoGeneric, 23, 12, CounterFieldId::AlgoNANDAccessesBin};
  }
  if (chip == "KX4") {
    return {parseCountersAlgoGenericKX4, 33, 38, CounterFieldId::RetentionIndication};
  }
  return vendorLayout(key);
}

/// Null, with a line on standard error, when the characteristic is missing or not a text
/// (`ifNoText`).
const std::string* readText(const PropertyDict& characteristics, const char* key,
                            const char* ifNoText) {
  const PropertyValue* value = characteristics.find(key);
  if (value == nullptr) {
    std::fprintf(stderr, "ERROR: Could not determine the %s\n", key);
    return nullptr;
  }
  if (value->string() == nullptr) {
    std::fprintf(stderr, "ERROR: %s %s\n", key, ifNoText);
  }
  return value->string();
}

std::optional<Characteristics> readCharacteristics(const PropertyValue* properties) {
  const PropertyDict* characteristics = properties != nullptr ? properties->dict() : nullptr;
  if (characteristics == nullptr) {
    std::fputs("ERROR: Could not parse the Device Characteristics dictionary\n", stderr);
    return std::nullopt;
  }
  constexpr const char* kChipKey = "chip-id";
  constexpr int kChipCapacity = 64;  // with a final NUL
  const std::string* chip =
      readText(*characteristics, kChipKey, "is not stored as a PVStringTypeID");
  if (chip == nullptr) {
    return std::nullopt;
  }
  if (chip->size() >= kChipCapacity) {
    std::fprintf(stderr,
                 "ERROR: Unable to obtain %s as conversion from the UniChar contents of PVString "
                 "failed, or the buffer of %d bytes is too small\n",
                 kChipKey, kChipCapacity);
    return std::nullopt;
  }
  const std::string* manufacturer = readText(*characteristics, "manufacturer-id", "is NULL");
  if (manufacturer == nullptr) {
    return std::nullopt;
  }
  const CounterLayout layout = counterLayout(*chip, *manufacturer);
  const Number* busCount = characteristics->findNumber("num-bus");
  if (busCount == nullptr) {
    std::fputs("ERROR: could not determine the number of channels\n", stderr);
    return std::nullopt;
  }
  return Characteristics{layout, busCount->asInt32()};
}

PropertyDict busRecord(const std::uint8_t* busEntry, const NandChannelCounters& counters,
                       const CounterLayout& layout) {
  constexpr std::size_t kMaxEntries = 175;
  PropertyDict record;
  record.reserve(kMaxEntries);
  for (std::size_t i = 0; i < kBusEntryKeys.size(); ++i) {
    setNumberValueForType(
        record, kBusEntryKeys[i],
        static_cast<std::int32_t>(loadLittleEndian<std::uint32_t>(busEntry + i * kWordSize)));
  }
  for (const CounterField& field : kCounterFields) {
    const auto id = static_cast<CounterFieldId>(&field - kCounterFields);
    for (std::size_t i = 0; i < layout.count(id); ++i) {
      setNumberValueForType(record, std::string(field.name) + '[' + std::to_string(i) + ']',
                            static_cast<std::int32_t>(counters[field.first + i]));
    }
  }
  return record;
}

}  // namespace

std::uint8_t hexStringToByte(std::string_view text, std::uint32_t length) {
  constexpr std::string_view kDigits = "0123456789abcdef";
  std::size_t value = 0;
  for (const char character : text.substr(0, std::min<std::size_t>(length, 2))) {
    const auto c = static_cast<char>(std::tolower(static_cast<unsigned char>(character)));
    const std::size_t digit = kDigits.find(c);
    if (digit == std::string_view::npos) {
      std::printf("unrecognized hex character: %c", c);
    }
    value = value * 16 + (digit != std::string_view::npos ? digit : 0);
  }
  return static_cast<std::uint8_t>(value);
}

std::uint32_t hexStringToInt32(std::string_view text, std::uint32_t length) {
  std::uint32_t value = 0;
  for (std::string_view rest = text.substr(0, std::min<std::size_t>(length, 8)); !rest.empty();) {
    const std::size_t byte = (rest.size() - 1) / 2;
    value |= std::uint32_t{hexStringToByte(rest, 2)} << (8 * byte);
    rest.remove_prefix(std::min<std::size_t>(rest.size(), 2));
  }
  return value;
}

bool LogNANDTelemetryList(std::span<const std::uint8_t> buffer,
                          const PropertyValue* characteristics, std::string_view /*className*/) {
  // One object for all buses: a layout always writes the same words.
  const std::unique_ptr<NandChannelCounters> counters(new (std::nothrow) NandChannelCounters());
  if (!counters) {
    std::fprintf(stderr, "ERROR: Could not malloc %zu bytes\n", sizeof *counters);
    return false;
  }
  const std::optional<Characteristics> read = readCharacteristics(characteristics);
  if (!read) {
    return false;
  }
  if (read->busCount <= 0) {
    return true;
  }
  const auto busCount = static_cast<std::size_t>(read->busCount);
  if (busCount * kBytesPerBus > buffer.size()) {
    std::fputs("ERROR: Attempting to parse beyond the bounds of the buffer\n", stderr);
    return false;
  }
  const std::uint8_t* busEntries = buffer.data() + busCount * kCounterRegionSize;
  for (std::size_t bus = 0; bus < busCount; ++bus) {
    const auto region = buffer.subspan(bus * kCounterRegionSize).first<kCounterRegionSize>();
    read->layout.parse(region, *counters);
    platform().logsmith().FLLogStructuredData(
        kListRecordType, busRecord(busEntries + bus * kBusEntrySize, *counters, read->layout));
  }
  return true;
}

}  // namespace vesprun
