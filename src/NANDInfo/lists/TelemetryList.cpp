#include "NANDInfo/lists/TelemetryList.h"

#include <array>
#include <cstddef>
#include <cstdio>
#include <memory>
#include <new>
#include <optional>
#include <string>

#include "NANDInfo/lists/HexText.h"
#include "NANDInfo/parsers/DictionaryHelpers.h"
#include "NANDInfo/parsers/VendorCounterParsers.h"
#include "platform/Platform.h"

namespace vesprun {
namespace {

constexpr std::int32_t kRecordType = 176;

// For B buses: B counter regions, then B bus entries.
constexpr std::size_t kWordSize = 4;
constexpr std::size_t kBusEntrySize = 32;
constexpr std::uint64_t kBytesPerBus = kCounterRegionSize + kBusEntrySize;

/// The words of a bus entry, in order; a last one is not used.
constexpr std::array<const char*, 7> kBusEntryKeys{"RD",  "PE",         "Max_PE_rate", "t0",
                                                   "Ret", "block_type", "num_pages"};
static_assert((kBusEntryKeys.size() + 1) * kWordSize == kBusEntrySize);

/// Consecutive words of `NandChannelCounters` that are logged as NAME[0], NAME[1] and so on.
struct CounterField {
  const char* name;
  std::size_t firstWord;
  std::size_t count;
};

/// Everything that depends on the flash in use.
struct CounterLayout {
  void (*parse)(CounterRegion, NandChannelCounters&);
  std::size_t readStageCount;
  std::size_t dspExceptionParameterCount;
  std::optional<CounterField> extraBins;

  /// The logged fields, in order.
  std::array<CounterField, 10> fields() const {
    return {{{"readStage", 0, readStageCount},
             {"initialReadStage", 33, 23},
             {"nandStageOfLife", 56, 8},
             {"dspExceptionParameter", 65, dspExceptionParameterCount},
             {"readStage18NumOfErrorsBin", 103, 12},
             {"readStage9NumOfErrorsBin", 115, 10},
             {"readStage10NumOfErrorsBin", 125, 10},
             {"readStage17NumOfErrorsBin", 135, 10},
             {"readStage19NumOfErrorsBin", 145, 12},
             extraBins.value_or(CounterField{"", 0, 0})}};
  }
};

constexpr CounterField kAlgoNANDAccessesBin{"algoNANDAccessesBin", 157, 8};
constexpr CounterField kRetentionIndication{"retentionIndication", 165, 12};
static_assert(kRetentionIndication.firstWord + kRetentionIndication.count ==
              kNandChannelCounterCount);

struct Characteristics {
  CounterLayout layout;
  std::int32_t busCount;
};

/// The first four hexadecimal digits, and the eight behind them without the last two.
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
      return {parseCounters1xSandisk, 23, 12, std::nullopt};
    case 0xAD8252232100:
      return {parseCounters1xHynix, 23, 12, std::nullopt};
    default:
      return {parseCounters1y, 23, 12, std::nullopt};
  }
}

CounterLayout counterLayout(std::string_view chip, std::string_view manufacturer) {
  const std::uint64_t key = manufacturerKey(manufacturer);
  if (chip == "KX3") {
    return {parseCountersAlgoGeneric, 23, 12, kAlgoNANDAccessesBin};
  }
  if (chip == "KX4") {
    return {parseCountersAlgoGenericKX4, 33, 38, kRetentionIndication};
  }
  return vendorLayout(key);
}

/// Null, with a line on the standard error stream, when there is no usable chip identifier.
const std::string* readChipIdentifier(const PropertyDict& characteristics) {
  constexpr int kCapacity = 64;  // with a final NUL
  const char* key = "chip-id";
  const PropertyValue* value = characteristics.find(key);
  if (value == nullptr) {
    std::fprintf(stderr, "ERROR: Could not determine the %s\n", key);
    return nullptr;
  }
  if (value->string() == nullptr) {
    std::fprintf(stderr, "ERROR: %s is not stored as a PVStringTypeID\n", key);
    return nullptr;
  }
  if (value->string()->size() >= kCapacity) {
    std::fprintf(stderr,
                 "ERROR: Unable to obtain %s as conversion from the UniChar contents of PVString "
                 "failed, or the buffer of %d bytes is too small\n",
                 key, kCapacity);
    return nullptr;
  }
  return value->string();
}

/// Null, with a line on the standard error stream, when there is no usable manufacturer identifier.
const std::string* readManufacturerIdentifier(const PropertyDict& characteristics) {
  const char* key = "manufacturer-id";
  const PropertyValue* value = characteristics.find(key);
  if (value == nullptr) {
    std::fprintf(stderr, "ERROR: Could not determine the %s\n", key);
    return nullptr;
  }
  if (value->string() == nullptr) {
    std::fprintf(stderr, "ERROR: %s is NULL\n", key);
    return nullptr;
  }
  return value->string();
}

std::optional<Characteristics> readCharacteristics(const PropertyValue* properties) {
  const PropertyDict* characteristics = properties != nullptr ? properties->dict() : nullptr;
  if (characteristics == nullptr) {
    std::fputs("ERROR: Could not parse the Device Characteristics dictionary\n", stderr);
    return std::nullopt;
  }
  const std::string* chip = readChipIdentifier(*characteristics);
  if (chip == nullptr) {
    return std::nullopt;
  }
  const std::string* manufacturer = readManufacturerIdentifier(*characteristics);
  if (manufacturer == nullptr) {
    return std::nullopt;
  }
  const CounterLayout layout = counterLayout(*chip, *manufacturer);
  const PropertyValue* busCount = characteristics->find("num-bus");
  if (busCount == nullptr || busCount->number() == nullptr) {
    std::fputs("ERROR: could not determine the number of channels\n", stderr);
    return std::nullopt;
  }
  return Characteristics{layout, busCount->number()->asInt32()};
}

PropertyDict busRecord(const std::uint8_t* busEntry, const NandChannelCounters& counters,
                       const CounterLayout& layout) {
  constexpr std::size_t kMostEntries = 175;
  PropertyDict record;
  record.reserve(kMostEntries);
  for (std::size_t i = 0; i < kBusEntryKeys.size(); ++i) {
    setNumberValueForType(record, kBusEntryKeys[i], busEntry + i * kWordSize, PVNumberType::Int);
  }
  for (const CounterField& field : layout.fields()) {
    for (std::size_t i = 0; i < field.count; ++i) {
      setNumberValueForType(record, field.name + ('[' + std::to_string(i) + ']'),
                            &counters[field.firstWord + i], PVNumberType::Int);
    }
  }
  return record;
}

}  // namespace

bool LogNANDTelemetryList(std::span<const std::uint8_t> buffer,
                          const PropertyValue* characteristics, std::string_view /*className*/) {
  const std::unique_ptr<NandChannelCounters> counters(new (std::nothrow) NandChannelCounters);
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
    counters->fill(0);
    const auto region = buffer.subspan(bus * kCounterRegionSize).first<kCounterRegionSize>();
    read->layout.parse(region, *counters);
    platform().logsmith().FLLogStructuredData(
        kRecordType, busRecord(busEntries + bus * kBusEntrySize, *counters, read->layout));
  }
  return true;
}

}  // namespace vesprun
