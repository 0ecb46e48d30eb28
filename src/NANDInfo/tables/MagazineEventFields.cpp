#include "NANDInfo/tables/EventFields.h"

namespace vesprun {
namespace {

constexpr auto kDailyRanges = std::to_array<FieldRange>({
    // clang-format off
    "averageSLCPECycles", "averageTLCPECycles", "directToTLCSectors", "HLT_Capacity_GB",
    "HLT_Diskfullness_BP", "HLT_SM_deltaDays", "fallbackToWaterfall", "flushNwToSlc",
    "flushNwToTlc", "gcWrites", "hostReads", "hostWrites", "lockToTlc", "nandReads", "nandWrites",
    "numDieFailures", "numEfail", "numFences", "numFlushes", "numGrownBad", "numPfail", "oslcHw",
    "powerOnHours", "raidFailedLbaMismatch", "raidFailedReconstructionHost",
    "raidFailedReconstructionInternal", "raidFailSectors", "raidParityInvalid",
    "slcGCInvalidations", "slcInvalidations", "ueccReads", "uncleanBoots",
    {"E2EDPErrorCounters_", 0, 11}, "raidSmartErrors", {"HLT_instantaneous_gc_wamp_", 0, 5},
    "Count",
    // clang-format on
});
constexpr FieldIndex kDailyIndex(kDailyRanges);
static_assert(kDailyIndex.fieldCount == 52);

constexpr auto kWeeklyRanges = std::to_array<FieldRange>({
    // clang-format off
    "averageSLCPECycles", "averageTLCPECycles", "HLT_Capacity_GB", "HLT_Diskfullness_BP",
    "flushNwToSlc", "flushNwToTlc", "gcWrites", "hostReads", "hostWrites", "nandReads",
    "nandWrites", "numFences", "numFlushes", "numGrownBad", "oslcHw", "slcGCInvalidations",
    "slcInvalidations", "uncleanBoots", "HLT_SM_deltaDays", "directToTLCSectors",
    "fallbackToWaterfall", "lockToTlc", "numDieFailures", "numEfail", "numPfail", "powerOnHours",
    "raidFailedLbaMismatch", "raidFailedReconstructionHost", "raidFailedReconstructionInternal",
    "raidFailSectors", "raidParityInvalid", "ueccReads", "Count",
    // clang-format on
});
constexpr FieldIndex kWeeklyIndex(kWeeklyRanges);
static_assert(kWeeklyIndex.fieldCount == 33);

constexpr auto kMonthlyRanges = std::to_array<FieldRange>({
    // clang-format off
    "averageSLCPECycles", "averageTLCPECycles", "HLT_Capacity_GB", "HLT_Diskfullness_BP",
    "HLT_SM_deltaDays", "flushNwToSlc", "flushNwToTlc", "gcWrites", "hostReads", "hostWrites",
    "nandReads", "nandWrites", "numFences", "numGrownBad", "oslcHw", "slcGCInvalidations",
    "numFlushes", "slcInvalidations", "uncleanBoots", "directToTLCSectors", "fallbackToWaterfall",
    "lockToTlc", "numDieFailures", "numEfail", "numPfail", "powerOnHours", "raidFailedLbaMismatch",
    "raidFailedReconstructionHost", "raidFailedReconstructionInternal", "raidFailSectors",
    "raidParityInvalid", "ueccReads", "Count",
    // clang-format on
});
constexpr FieldIndex kMonthlyIndex(kMonthlyRanges);
static_assert(kMonthlyIndex.fieldCount == 33);

}  // namespace

constinit const FieldTable massStorage_NANDInfo_SM_Daily_FTLCounters_1(kDailyRanges, kDailyIndex);

constinit const FieldTable massStorage_NANDInfo_SM_WeeklyMA_FTLCounters_1(kWeeklyRanges,
                                                                          kWeeklyIndex);

constinit const FieldTable massStorage_NANDInfo_SM_Monthly_FTLCounters_1(kMonthlyRanges,
                                                                         kMonthlyIndex);

}  // namespace vesprun
