#include "NANDInfo/sets/NANDInfoDict.h"

#include <algorithm>
#include <iterator>
#include <string_view>

#include "NANDInfo/sets/FilteredDict.h"
#include "NANDInfo/sets/StorageHealthFields.h"
#include "NANDInfo/tables/LegacyKeyMap.h"

namespace vesprun {
namespace {

/// Figures that combine several fields.
struct DerivedFigures {
  static constexpr std::uint64_t kNotSeen = 0xFFFFFFFF;

  std::uint64_t userPartitionStart = kNotSeen;
  std::uint64_t intermediatePartitionStart = kNotSeen;
  std::uint64_t maintenanceRequests = 0;
  std::uint64_t failedReads = 0;
  std::uint64_t failedPrograms = 0;
  std::uint64_t failedErases = 0;
};

enum class Use { Remember, Add, CountNonzero };

struct DerivedField {
  std::string_view name;
  Use use;
  std::uint64_t DerivedFigures::*figure;
};

constexpr DerivedField kDerivedFields[] = {
    {"userPartitionStart", Use::Remember, &DerivedFigures::userPartitionStart},
    {"intermediatePartitionStart", Use::Remember, &DerivedFigures::intermediatePartitionStart},
    {"numBootBlockRefreshSuccess0", Use::Add, &DerivedFigures::maintenanceRequests},
    {"numBootBlockRefreshFail0", Use::Add, &DerivedFigures::maintenanceRequests},
    {"mspBootBlockReadFail0", Use::CountNonzero, &DerivedFigures::failedReads},
    {"mspBootBlockReadFail1", Use::CountNonzero, &DerivedFigures::failedReads},
    {"mspBootBlockReadFail2", Use::CountNonzero, &DerivedFigures::failedReads},
    {"mspBootBlockProgFail0", Use::CountNonzero, &DerivedFigures::failedPrograms},
    {"mspBootBlockProgFail1", Use::CountNonzero, &DerivedFigures::failedPrograms},
    {"mspBootBlockProgFail2", Use::CountNonzero, &DerivedFigures::failedPrograms},
    {"mspBootBlockEraseFail0", Use::CountNonzero, &DerivedFigures::failedErases},
    {"mspBootBlockEraseFail1", Use::CountNonzero, &DerivedFigures::failedErases},
    {"mspBootBlockEraseFail2", Use::CountNonzero, &DerivedFigures::failedErases},
};

/// Adds a field to the figures; false when it belongs to none.
bool takeUp(const GenericParserCxt::Field& field, DerivedFigures& figures) {
  const auto* derived =
      std::find_if(std::begin(kDerivedFields), std::end(kDerivedFields),
                   [&](const DerivedField& known) { return known.name == field.name; });
  if (derived == std::end(kDerivedFields)) {
    return false;
  }
  std::uint64_t& figure = figures.*derived->figure;
  switch (derived->use) {
    case Use::Remember:
      figure = field.value;
      break;
    case Use::Add:
      figure += field.value;
      break;
    case Use::CountNonzero:
      figure += field.value != 0 ? 1 : 0;
      break;
  }
  return true;
}

/// Durations keep 3 significant digits of their low 32 bits.
bool isRounded(std::string_view name) {
  return name == "maxMemLowDuration" || name == "maxMemChokeDuration";
}

}  // namespace

PropertyDict CreateNANDInfoDict(const ORUStatsContext& context, bool omitVersionFields) {
  PropertyDict info;
  if (!omitVersionFields) {
    info.set("com.quill.NANDInfo.ExportVersion", context.exportVersion);
    info.set("com.quill.NANDInfo.DriverVersion", context.driverVersion);
    info.set("com.quill.NANDInfo.DemoMode", std::uint64_t{isInStoreDemoMode()});
  }
  info.set("com.quill.NANDInfo.NumVirtualBlocks", context.numVirtualBlocks);
  info.set("com.quill.NANDInfo.PagesPerVirtualBlock", context.pagesPerVirtualBlock);
  info.set("com.quill.NANDInfo.BytesPerPage", context.bytesPerPage);
  info.set("com.quill.NANDInfo.NumLogicalReads", context.hostReads);
  info.set("com.quill.NANDInfo.NumLogicalWrites", context.hostWrites);
  info.set("com.quill.NANDInfo.NumFreeVirtualBlocks", context.numFreeVirtualBlocks);
  info.set("com.quill.NANDInfo.NumWearLevelOps", context.wearLevMoves);
  info.set("com.quill.NANDInfo.NumPhysicalReads", context.nandReads);
  info.set("com.quill.NANDInfo.NumPhysicalWrites", context.nandWrites);
  info.set("com.quill.NANDInfo.NumPhysicalErases", context.bandErases);
  info.set("com.quill.NANDInfo.NodesFree", context.IND_pool_free);
  info.set("com.quill.NANDInfo.NodesTotal", context.IND_pool_count);
  // Weeks, despite the key's name.
  info.set("com.quill.NANDInfo.formatDaysSince2000", weeksSince2000(context.utilFormatTime));
  info.set("com.quill.NANDInfo.NumSleepOps", context.numSleepOps);
  info.set("com.quill.NANDInfo.HighEnduranceBlockEraseCount", context.maxHighEnduranceBlockErases);
  info.set("com.quill.NANDInfo.BlocksPerVirtualBlock", context.blocksPerVirtualBlock);
  static constexpr std::string_view kReadCountKeys[] = {
      "com.quill.NANDInfo.ReadsBeforeErasure0", "com.quill.NANDInfo.ReadsBeforeErasure50000",
      "com.quill.NANDInfo.ReadsBeforeErasure100000", "com.quill.NANDInfo.ReadsBeforeErasure150000",
      "com.quill.NANDInfo.ReadsBeforeErasure200000"};
  for (std::size_t i = 0; i < std::size(kReadCountKeys); ++i) {
    info.set(kReadCountKeys[i], context.readCountHisto[i]);
  }

  DerivedFigures figures;
  context.fields.forEach([&](const GenericParserCxt::Field& field) {
    if (takeUp(field, figures)) {
      return;
    }
    if (const auto key = legacyKeyOf(field.name)) {
      info.set(*key, isRounded(field.name) ? roundSig(static_cast<std::uint32_t>(field.value), 3)
                                           : field.value);
    }
  });
  if (figures.userPartitionStart != DerivedFigures::kNotSeen &&
      figures.intermediatePartitionStart != DerivedFigures::kNotSeen) {
    info.set("com.quill.NANDInfo.IntermediatePartitionSize",
             figures.userPartitionStart - figures.intermediatePartitionStart);
  }
  info.set("com.quill.NANDInfo.NumMaintenanceRequests", figures.maintenanceRequests);
  info.set("com.quill.NANDInfo.MaintenanceRequestsFailedRead", figures.failedReads);
  info.set("com.quill.NANDInfo.MaintenanceRequestsFailedProg", figures.failedPrograms);
  info.set("com.quill.NANDInfo.MaintenanceRequestsFailedErase", figures.failedErases);
  return info;
}

}  // namespace vesprun
