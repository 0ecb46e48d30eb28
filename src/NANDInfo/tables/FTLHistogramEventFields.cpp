#include "NANDInfo/tables/EventFields.h"

namespace vesprun {
namespace {

constexpr auto kFirstRanges = std::to_array<FieldRange>({
    // clang-format off
    {"gracefulBootTimeLogMs_", 0, 7}, {"ungracefulBootTimeLogMs_", 0, 7},
    {"E2EDPErrorCounters_", 0, 11}, {"wcacheDSOverWrLogSizeCnts_", 0, 9},
    {"bandsMaxTempHisto_", 0, 21}, {"bandsMinTempHisto_", 0, 21},
    {"bandsLifeTimeTempHisto_", 0, 29}, {"bandsDeltaTempHisto_", 0, 21},
    {"bandsCrossTempHisto_", 0, 44}, {"wcacheWaitLogMs_", 0, 2}, {"wcacheWaitLogMs_", 4, 9},
    {"wcacheDS_segsSortedLogSize_", 0, 9}, {"CacheDepthVsThroughput_", 0, 255},
    {"balanceProportionBucketsHistogram_", 0, 10}, {"burstSizeHistogram_", 0, 9},
    {"wcacheDirtyAtFlush_", 0, 15}, {"slcDemandBurstSizeDetected_", 0, 9},
    {"slcDemandBurstDur_", 0, 9}, {"slcDemandBurstSizeSlc_", 0, 9}, {"gcActiveReasons_", 0, 8},
    {"eanBootReadsHist_", 0, 9}, {"clogFailReason_", 0, 12}, {"oslcDemandBurstSize_", 0, 9},
    "HLT_APIErrorCode", "HLT_OR_Capacity_GB", "HLT_averageTLCPECycles", "HLT_averageSLCPECycles",
    "HLT_hostWrites", "HLT_formatWeeksSince2000", {"oslcNoVotesHw_", 0, 7}, {"qosPerCmdQ_", 0, 159},
    {"maxQosPerCmdQ_", 0, 9}, {"injDepth_", 0, 11}, {"mspbootBlockRefreshCnt_", 0, 3},
    {"vcurve_", 0, 31}, {"cbdrInitSent_", 0, 2}, {"cbdrRefreshedAges_", 0, 8},
    {"cbdrRefreshedAgesSLC_", 0, 8}, {"cbdrRefreshGrades_", 0, 9}, {"cbdrScanPct_", 0, 4},
    {"cpuBurstLength", 0, 7}, {"gcSearchTimeHistory", 0, 9}, {"gcSearchPortion", 0, 15},
    {"dmReasonsSlc", 0, 18}, {"dmReasonsTlc", 0, 18}, {"cpuBurstLength_", 0, 7},
    {"gcSearchTimeHistory_", 0, 9}, {"gcSearchPortion_", 0, 15}, {"dmReasonsSlc_", 0, 20},
    {"dmReasonsSlc_", 27, 31}, {"dmReasonsTlc_", 0, 20}, {"dmReasonsTlc_", 27, 31}, "Count",
    // clang-format on
});
constexpr FieldIndex kFirstIndex(kFirstRanges);
static_assert(kFirstIndex.fieldCount == 990);

constexpr auto kSecondRanges = std::to_array<FieldRange>({
    // clang-format off
    "HLT_APIErrorCode", "HLT_averageSLCPECycles", "HLT_averageTLCPECycles",
    "HLT_formatWeeksSince2000", "HLT_hostWrites", "HLT_OR_Capacity_GB", "HLT_OR_Diskfullness_BP",
    {"numOfThrottlingEntriesPerLevel_", 0, 15}, {"raidReconstructDurationHisto_", 0, 7},
    {"failsOnReconstructHisto_", 0, 7}, {"bdrTmpHist_", 0, 63}, "Count",
    // clang-format on
});
constexpr FieldIndex kSecondIndex(kSecondRanges);
static_assert(kSecondIndex.fieldCount == 104);

}  // namespace

constinit const FieldTable massStorage_NANDInfo_FTLHistograms_1(kFirstRanges, kFirstIndex);

constinit const FieldTable massStorage_NANDInfo_FTLHistograms_2(kSecondRanges, kSecondIndex);

}  // namespace vesprun
