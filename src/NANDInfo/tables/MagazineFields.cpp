#include "NANDInfo/tables/MagazineFields.h"

namespace vesprun {
namespace {

constexpr auto kAccumulatingRanges = std::to_array<FieldRange>({
    // clang-format off
    {"CacheDepthVsThroughput_", 0, 255}, {"E2EDPErrorCounters_", 0, 11}, "autowriteDS2FSCollisions",
    "averageSLCPECycles", "averageTLCPECycles", {"balanceProportionBucketsHistogram_", 0, 10},
    "bandErases", "bandGetsExtreme", "bandGetsLow", {"bandsCrossTempHisto_", 0, 44},
    {"bandsLifeTimeTempHisto_", 0, 29}, {"bandsPerHostFlow_", 0, 3}, {"bandsPerSpecialFlow_", 0, 2},
    "bandsPerSpecialFlow_4", "bandsRefreshedOnError", "bdrPadding", {"bitflipCount_", 0, 4},
    {"burstSizeHistogram_", 0, 9}, {"clogFailReason_", 0, 12}, "clogFastCxtAbvThr",
    "clogFastCxtSyncAborted", "clogNumFastCxt", "clogNumRapidReboots",
    {"clogOccupationSectors_", 0, 4}, {"clogPagesFillingPercentage_", 0, 3}, "clogProgram",
    "cntCalTimeWentBackWard", "cntTimeWentBackWardOnBoot", {"commitPadSectorsPerFlow_", 0, 3},
    {"cpuBurstLength_", 0, 7}, "dataFabricErr", "directToTLCBands", "directToTLCSectors",
    "downlinkFabricErr", "eanCompressWrites", "eanFailSectors", "eanFastWrites",
    {"eanFirstReadMode_", 0, 1}, "eanHostFlushes", "eanHostUnmaps", "eanHostWrites",
    "fallbackToWaterfall", "fastHwBurstToSlc", "fastHwToTlcBalance", "fastHwToTlcBurst",
    "flushNwToSlc", "flushNwToTlc", {"gcActiveReasons_", 0, 8}, "gcDestinations", "gcLonlyWrites",
    {"gcSearchPortion_", 0, 15}, {"gcSearchTimeHistory_", 0, 9}, "gcSlcDestinations",
    "gcVPackDestinations", "gcVPackWrites", "gcWithoutBMs", "gcWrites", "hostReads", "hostWrites",
    "hostWritesDyn", "hostWritesMeta", "hostWritesPhoto", "hostWritesStatic", "indFlowPrograms",
    "indmbUnitsCache", "intermediateBandErases", "internalUeccs", "lockToTlc", "metaMismatchReread",
    "nandReads", "nandWrites", "numBandsPaddedForAge", {"numBandsRefreshedForAgePerTier_", 0, 2},
    "numBisWrites", "numBootChainUpdates", "numClogLoadFails", "numCrossTempUecc", "numDieFailures",
    "numEfail", "numFWUpdates", "numFences", "numFirmwareWrites", "numFlushes", "numFormatUserArea",
    "numGrownBad", "numHostChoke", "numMemChoke", "numMemLow", "numOfAvoidedGCDueToTemp",
    "numPfail", "numRefreshOnClockLoss", "numSleepOps", "openBandReadFail", "oslcBdrBands",
    "oslcBdrValid", {"oslcDemandBurstSize_", 0, 9}, "oslcGCActivateReason", "oslcGCActiveWrites",
    "oslcGCinvalidations", "oslcHw", "oslcHwGC", "oslcHwNRP", "oslcHwTT", {"oslcNoVotesHw_", 0, 7},
    "oslcTransitions", {"overWritesPerSpecialFlow_", 0, 2}, {"padSectorsPerFlow_", 0, 4},
    {"padSizes_", 0, 3}, {"powerBudgetSelect_", 0, 3}, "powerOnHours", "powerOnSeconds",
    "prpAccTimeoutErr", "raidExpectedFailRMXReconstructionHost",
    "raidExpectedFailRMXReconstructionInternal", "raidFailSectors", "raidFailedLbaMismatch",
    "raidFailedPMXReconstructionHost", "raidFailedPMXReconstructionInternal",
    "raidFailedRMXReconstructionHost", "raidFailedRMXReconstructionInternal", "raidFailedReadBlog",
    "raidFailedReadNoBlog", "raidFailedReadParity", "raidFailedReadParityInternal",
    "raidFailedReadQCopy", "raidFailedReadQCopyInternal", "raidFailedReadQParity",
    "raidFailedReadQParityInternal", {"raidFailedRecoEAN_", 0, 3}, "raidFailedReconstructionHost",
    "raidFailedReconstructionInternal", "raidFailedReconstructionQParity", "raidGCBands",
    "raidGCPadding", "raidGCSectors", "raidParityGCUnc", "raidParityInvalid", "raidParityNotSavedP",
    "raidParityNotSavedQ", "raidParityUnknown", "raidParityUnmapped",
    "raidReconstructFailBandFlowGC", "raidReconstructFailBandFlowHost",
    "raidReconstructFailBandFlowOslc", "raidReconstructFailBlank", "raidReconstructFailDouble",
    {"raidReconstructFailFlow_", 0, 4}, "raidReconstructFailInvalid", "raidReconstructFailMismatch",
    "raidReconstructFailNoSPBX", "raidReconstructFailP", {"raidReconstructFailPartition_", 0, 1},
    "raidReconstructFailQ", "raidReconstructFailUECC", "raidReconstructFailUnsupp",
    "raidReconstructSuccessBandFlowOslc", {"raidReconstructSuccessFlow_", 0, 4},
    {"raidReconstructSuccessPartition_", 0, 1}, "raidSLCBandsPerHostFlow", "raidSLCPadding",
    "raidSLCSecsPerHostFlow", "raidSecsPerHostFlow", "raidSmartErrors",
    "raidSuccessfulPMXReconstructionHost", "raidSuccessfulPMXReconstructionInternal",
    "raidSuccessfulRMXReconstructionHost", "raidSuccessfulRMXReconstructionInternal",
    {"raidSuccessfulRecoEAN_", 0, 3}, "raidSuccessfulReconstructionHost",
    "raidSuccessfulReconstructionInternal", "raidUncleanBootBandFail", "raidVerificationReads",
    {"readCountHisto_", 0, 4}, {"secsPerHostFlow_", 0, 3}, "skinnyAPGMRetire", "skinnyBandsGBB",
    "skinnyRevectorSLC", "skinnyRevectorTLC", "slcDemandBurstCount", {"slcDemandBurstDur_", 0, 9},
    {"slcDemandBurstSizeDetected_", 0, 9}, {"slcDemandBurstSizeSlc_", 0, 9},
    "slcDemandBurstWritesInGC", "slcDemandBurstWritesInNRP", "slcDemandBurstWritesInTT",
    "slcDemandFlushCount", "slcGCInvalidations", "slcInvalidations", "slowHwFlushToSlc",
    "slowHwToSlc", "slowHwToTlc", "snapshotCPUHigh", "snapshotCPULow", "ueccReads", "uncleanBoots",
    {"unmapsPerSpecialFlow_", 0, 2}, "uplinkFabricErr", "waterfallLockSectors",
    {"wcacheDSOverWrSizeByFlow_", 0, 3}, "wcacheDS_Reads", {"wcacheDirtyAtFlush_", 0, 15},
    "wearLevMoves",
    // clang-format on
});

constexpr auto kDynamicRanges = std::to_array<FieldRange>({
    // clang-format off
    "IND_pool_count", "IND_pool_free", "averageGracefulBootTimeMs", "averageSkinnyPECycles",
    "averageUngracefulBootTimeMs", "avgBgInitTimeMs", {"coldestCycle_", 0, 1},
    "eanAvgBootReadMBPerSec", "eanAvgBootReadTimeMs", "eanAvgInitTimeMs", "eanAvgToFirstReadTimeMs",
    "eanMaxBootReadTimeMs", "eanMaxInitTimeMs", "eanMinBootReadMBPerSec", "eanMinToFirstReadTimeMs",
    {"hottestCycle_", 0, 1}, "maxBgInitTimeMs", "maxFailedFastCxtSync", "maxGracefulBootTimeMs",
    "maxHighEnduranceBlockErases", "maxMemChokeDuration", "maxMemExtremeDuration",
    "maxSkinnyPECycles", "maxUngracefulBootTimeMs", "memChokeDuration", "memExtremeDuration",
    "minSkinnyPECycles", "numFreeVirtualBlocks", "numMemExtreme", {"overWritesPerHostFlow_", 0, 3},
    "staticSizeInMB", {"unmapsPerHostFlow_", 0, 3}, "wcacheSectorsCur",
    // clang-format on
});

}  // namespace

constinit const FieldTable PrivacyApprovedSMagNANDFTLCounters_Accum =
    fieldTable<kAccumulatingRanges, 731>();

constinit const FieldTable PrivacyApprovedSMagNANDFTLCounters_Dynamic =
    fieldTable<kDynamicRanges, 41>();

}  // namespace vesprun
