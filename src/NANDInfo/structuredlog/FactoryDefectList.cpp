#include "NANDInfo/structuredlog/FactoryDefectList.h"

#include <algorithm>
#include <array>
#include <bit>
#include <cstddef>
#include <cstdio>
#include <cstring>

#include "NANDInfo/structuredlog/StructuredLog.h"
#include "common/LittleEndian.h"
#include "platform/DictionaryHelpers.h"
#include "platform/Platform.h"

namespace vesprun {
namespace {

// The header: an unused word, the factory count, the number of records.
constexpr std::size_t kFactoryCountOffset = 4;
constexpr std::size_t kRecordCountOffset = 8;
constexpr std::size_t kListHeaderSize = 12;

/// A defect record, little-endian.
struct DefectRecord {
  std::uint16_t bus;
  std::uint16_t chipEnable;
  std::uint32_t cau;
  std::uint32_t block;
  std::uint32_t cycle;
  std::uint32_t reason;
  std::uint32_t page;
  std::int8_t temperature;
  std::array<std::uint8_t, 3> unused;
  std::uint32_t mode;

  /// The reason adjusted by the mode, in 32 bits.
  std::uint32_t adjustedReason() const {
    switch (mode) {
      case 0:
        return reason;
      case 1:
        return reason + 200;
      case 2:
        return reason + 100;
      default:
        std::fprintf(stderr, "Encountered unexpected defectMode: 0x%x", mode);
        return reason;
    }
  }
};

static_assert(sizeof(DefectRecord) == 32 && std::endian::native == std::endian::little);

PropertyValue signedNumber(std::uint32_t word) { return static_cast<std::int32_t>(word); }

void logHeader(std::uint32_t factoryCount, const PropertyValue* properties) {
  PropertyDict record{{"Factory Count", signedNumber(factoryCount)}};
  const PropertyDict* characteristics = properties != nullptr ? properties->dict() : nullptr;
  const Number* description =
      characteristics != nullptr ? characteristics->findNumber("nand-device-desc") : nullptr;
  if (description != nullptr) {
    record.set("com.quill.NANDInfo.nandDesc", description->asInt32());
  }
  platform().logsmith().FLLogStructuredData(kListRecordType, record);
}

void logDefect(const DefectRecord& defect, bool modeAdjustsReason) {
  PropertyDict record{
      {"Bus", std::int32_t{defect.bus}},
      {"CE", std::int32_t{defect.chipEnable}},
      {"CAU", signedNumber(defect.cau)},
      {"Block", signedNumber(defect.block)},
      {"Cycle", signedNumber(defect.cycle)},
      {"Reason", signedNumber(modeAdjustsReason ? defect.adjustedReason() : defect.reason)},
      {"Page", signedNumber(defect.page)},
  };
  setNumberValueForType(record, "Temperature", defect.temperature);
  platform().logsmith().FLLogStructuredData(kListRecordType, record);
}

}  // namespace

bool LogFactoryDefectList(std::span<const std::uint8_t> buffer, const PropertyValue* properties,
                          std::string_view className) {
  if (buffer.size() >= kRecordCountOffset) {
    logHeader(loadLittleEndian<std::uint32_t>(buffer.data() + kFactoryCountOffset), properties);
  }
  if (buffer.size() < kListHeaderSize) {
    return true;
  }
  const std::size_t stated = loadLittleEndian<std::uint32_t>(buffer.data() + kRecordCountOffset);
  const std::size_t count =
      std::min(stated, (buffer.size() - kListHeaderSize) / sizeof(DefectRecord));
  for (std::size_t i = 0; i < count; ++i) {
    DefectRecord defect{};
    std::memcpy(&defect, buffer.data() + kListHeaderSize + i * sizeof defect, sizeof defect);
    logDefect(defect, className != "ORUStorage");
  }
  return true;
}

}  // namespace vesprun
