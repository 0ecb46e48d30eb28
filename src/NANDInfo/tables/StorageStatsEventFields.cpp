#include "NANDInfo/tables/EventFields.h"

namespace vesprun {
namespace {

constexpr auto kStorageEventRanges = std::to_array<FieldRange>({
    // clang-format off
    "EAN_updateCount_FW", "EAN_updateCount_LowPowerEM", "EAN_updateCount_NonEssentialFW",
    "EAN_updateCount_LTH", "EAN_updateCount_fConfig", "EAN_updateCount_dConfig",
    "EAN_updateCount_BIC", "EAN_imageSize_LTH", "EAN_imageSize_BIC", "HLT_APIErrorCode",
    "HLT_averageSLCPECycles", "HLT_averageTLCPECycles", "HLT_formatWeeksSince2000",
    "HLT_hostWrites", "HLT_OR_Capacity_GB", "HLT_OR_Diskfullness_BP", "Count",
    // clang-format on
});
constexpr FieldIndex kStorageEventIndex(kStorageEventRanges);
static_assert(kStorageEventIndex.fieldCount == 17);

}  // namespace

constinit const FieldTable massStorage_NANDInfo_StorageStats_1(kStorageEventRanges,
                                                               kStorageEventIndex);

}  // namespace vesprun
