#include "NANDInfo/tables/FieldSets.h"

namespace vesprun {
namespace {

constexpr auto kDigitRanges = std::to_array<FieldRange>({
    // clang-format off
    {4, "EAN_updateCount_BIC"}, {4, "EAN_updateCount_FW"}, {4, "EAN_updateCount_LTH"},
    {4, "EAN_updateCount_LowPowerEM"}, {4, "EAN_updateCount_NonEssentialFW"},
    {4, "EAN_updateCount_dConfig"}, {4, "EAN_updateCount_fConfig"}, {4, "HLT_APIErrorCode"},
    {4, "HLT_Diskfullness_BP"}, {4, "HLT_OR_Diskfullness_BP"}, {4, "HLT_SM_deltaDays"},
    {5, "EAN_imageSize_BIC"}, {5, "EAN_imageSize_LTH"}, {5, "HLT_OR_Capacity_GB"},
    {5, "HLT_averageTLCPECycles"}, {5, "HLT_formatWeeksSince2000"}, {5, "HLT_powerOnHours"},
    {5, "HLT_powerOnSeconds"}, {6, "HLT_averageSLCPECycles"}, {8, "HLT_hostWrites"},
    // clang-format on
});
constexpr FieldIndex kDigitIndex(kDigitRanges);
static_assert(kDigitIndex.fieldCount == 20);

constexpr auto kDerivedRanges = std::to_array<FieldRange>({
    // clang-format off
    "HLT_APIErrorMessage", "HLT_APIErrorCode", "HLT_OR_Diskfullness_BP", "HLT_OR_Capacity_GB",
    "HLT_averageTLCPECycles", "HLT_averageSLCPECycles", "HLT_hostWrites",
    "HLT_formatWeeksSince2000", "HLT_Reclaimer_totalPurgeable", "HLT_Reclaimer_totalNonPurgeable",
    "HLT_mspBootBlockReadFails_main", "HLT_mspBootBlockReadFails_backup",
    "HLT_mspBootBlockProgFails_main", "HLT_mspBootBlockProgFails_backup",
    "HLT_mspBootBlockEraseFails_main", "HLT_mspBootBlockEraseFails_backup",
    "HLT_numBootBlockRefreshes_max", "HLT_OR_AmountDataAvailable_MB", "HLT_Capacity_GB",
    "HLT_Diskfullness_BP", "HLT_SM_deltaDays", "HLT_UserCapacity_MB", "HLT_powerOnHours",
    "HLT_powerOnSeconds", {"HLT_instantaneous_gc_wamp_", 0, 5},
    // clang-format on
});
constexpr FieldIndex kDerivedIndex(kDerivedRanges);
static_assert(kDerivedIndex.fieldCount == 30);

}  // namespace

constinit const FieldTable WhitelistedStorageStats_SigDigDict(kDigitRanges, kDigitIndex);

constinit const FieldTable FTLStats4MSPStats(kDerivedRanges, kDerivedIndex);

}  // namespace vesprun
