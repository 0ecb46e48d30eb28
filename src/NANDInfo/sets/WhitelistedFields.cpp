#include "NANDInfo/sets/WhitelistedFields.h"

#include <cstdint>
#include <string>
#include <string_view>

#include "NANDInfo/controller/EANQueries.h"
#include "NANDInfo/parsers/ErrorMessages.h"
#include "NANDInfo/sets/FilteredDict.h"
#include "NANDInfo/sets/StatisticsGathering.h"
#include "NANDInfo/sets/StorageHealthFields.h"
#include "NANDInfo/tables/FieldSets.h"

namespace vesprun {
namespace {

constexpr std::string_view kFirmwareVersionKey = "fw_version_identifier";

constexpr std::string_view kHealthFieldsOfStorageStats[] = {
    "HLT_formatWeeksSince2000", "HLT_OR_Capacity_GB", "HLT_averageSLCPECycles",
    "HLT_averageTLCPECycles",   "HLT_hostWrites",     "HLT_OR_Diskfullness_BP"};

/// A figure of the image with that code.
struct ImageFigure {
  std::string_view field;
  std::uint64_t (*query)(std::uint32_t code);
  char code[5];
};

constexpr ImageFigure kImageFigures[] = {
    {"EAN_imageSize_BIC", GetEANImageSize, "dBIC"},
    {"EAN_imageSize_LTH", GetEANImageSize, "dLTH"},
    {"EAN_updateCount_FW", GetEANUpdateCount, "ifw1"},
    {"EAN_updateCount_BIC", GetEANUpdateCount, "dBIC"},
    {"EAN_updateCount_LTH", GetEANUpdateCount, "dLTH"},
    {"EAN_updateCount_dConfig", GetEANUpdateCount, "dCfg"},
    {"EAN_updateCount_fConfig", GetEANUpdateCount, "fCfg"},
    {"EAN_updateCount_NonEssentialFW", GetEANUpdateCount, "nefw"},
    {"EAN_updateCount_LowPowerEM", GetEANUpdateCount, "LPEM"},
};

constexpr std::uint32_t fourCharacterCode(const char (&text)[5]) {
  std::uint32_t code = 0;
  for (unsigned i = 0; i < 4; ++i) {
    code = code << 8 | static_cast<unsigned char>(text[i]);
  }
  return code;
}

/// The version keeps all of its digits when the set is rounded.
void addFirmwareVersionParts(PropertyDict& set) {
  const Number* number = set.findNumber(kFirmwareVersionKey);
  if (number == nullptr) {
    return;
  }
  const std::uint64_t version = number->asUInt64();
  for (unsigned part = 0; part < 4; ++part) {
    set.set(std::string(kFirmwareVersionKey) + '_' + std::to_string(part),
            version >> (16 * part) & 0xFFFF);
  }
}

}  // namespace

std::optional<PropertyDict> gatherFTLInfo(bool useStatKeyParser) {
  std::optional<PropertyDict> fields = gatherORUFTLData(useStatKeyParser, true, 0);
  if (!fields || fields->empty()) {
    SetAPIErrorMessage("CopyWhitelistedNANDFTLInfo: Unable to gather other stats magazine deltas");
  }
  if (fields) {
    fields->set(kAPIErrorMessageKey, GetAPIErrorMessage());
  }
  return fields;
}

PropertyDict gatherWhitelistedFTLInfo(bool round) {
  const FieldTable* const digits = &WhitelistedRawNANDFTLCounters_SigDigDict;
  PropertyDict set, sources;
  if (gatherFTLFields(false, true, 0, [&](const FTLFields& ftl) {
        set = CreateFilteredDict_SigDig(ftl.fields, digits, round);
        sources = CreateDictFromCxt(ftl.fields, &kSourcesOfOtherData);
      })) {
    set.merge(CreateFilteredDict_SigDig(gatherORUFTLOtherData(&sources), digits, round));
  } else {
    SetAPIErrorMessage("CopyWhitelistedNANDFTLInfo: Unable to gather other FTL fields");
  }
  set.set(kAPIErrorMessageKey, GetAPIErrorMessage());
  return set;
}

PropertyDict gatherWhitelistedMSPInfo(bool round) {
  PropertyDict sets;
  if (const std::optional<PropertyDict> fieldsByIndex =
          gatherORUMSPData(&WhitelistedRawNANDMSPCounters_SigDigDict, round)) {
    const PropertyDict derived = gatherORUOtherData();
    for (const auto& [index, fields] : *fieldsByIndex) {
      PropertyDict set = *fields.dict();
      set.merge(derived);
      addFirmwareVersionParts(set);
      sets.set(index, std::move(set));
    }
  } else {
    SetAPIErrorMessage("CopyWhitelistedNANDMSPInfo: Unable to gather MSP fields");
  }
  sets.set(kAPIErrorMessageKey, GetAPIErrorMessage());
  return sets;
}

PropertyDict gatherWhitelistedStorageStats(bool round) {
  PropertyDict fields;
  const PropertyDict derived = gatherORUOtherData();
  for (const std::string_view name : kHealthFieldsOfStorageStats) {
    copyField(derived, name, fields, name);
  }
  for (const ImageFigure& figure : kImageFigures) {
    fields.set(figure.field, figure.query(fourCharacterCode(figure.code)));
  }
  PropertyDict set = CreateFilteredDict_SigDig(fields, &WhitelistedStorageStats_SigDigDict, round);
  set.set(kAPIErrorMessageKey, GetAPIErrorMessage());
  return set;
}

}  // namespace vesprun
