#include "NANDInfo/tables/EventFields.h"

namespace vesprun {
namespace {

constexpr auto kFTLEventRanges = std::to_array<FieldRange>({
    // clang-format off
    "kx3FwVer", "nandDesc", "hostWrites", "hostWritesDyn", "hostWritesStatic", "hostReads",
    "uncleanBoots", "IND_pool_free", "IND_pool_count", "gcWrites", "wearLevMoves", "nandWrites",
    "nandReads", "bandErases", "numPfail", "numEfail", "hostWritesMeta", "numSleepOps",
    "cntTimeWentBackWardOnBoot", "numFlushes", "clogProgram", "maxHighEnduranceBlockErases",
    "numFactoryBad", "numGrownBad", "numFreeVirtualBlocks", "bytesPerPage", "pagesPerVirtualBlock",
    "blocksPerVirtualBlock", "numVirtualBlocks", "staticSizeInMB", "slcInvalidations",
    "slcGCInvalidations", "intermediateBandErases", {"numBandsRefreshedForAgePerTier_", 0, 2},
    "numRefreshOnClockLoss", "hostWritesPhoto", "numBandsPaddedForAge", {"bandsPerHostFlow_", 0, 3},
    {"bandsPerSpecialFlow_", 0, 2}, "bandsPerSpecialFlow_4", {"secsPerHostFlow_", 0, 3},
    {"overWritesPerHostFlow_", 0, 3}, {"overWritesPerSpecialFlow_", 0, 2},
    {"padSectorsPerFlow_", 0, 4}, {"padSizes_", 0, 3}, {"unmapsPerHostFlow_", 0, 3},
    {"unmapsPerSpecialFlow_", 0, 2}, {"coldestCycle_", 0, 1}, {"hottestCycle_", 0, 1},
    "gcLonlyWrites", "gcPLWrites", "pagesPerVirtualBlockSlc", "bdrPadding",
    "raidSuccessfulReconstructionInternal", "raidSuccessfulReconstructionHost",
    "raidFailedReconstructionInternal", "raidFailedReconstructionHost", "raidSecsPerHostFlow",
    "gcDestinations", "numMemChoke", "maxMemChokeDuration", "memChokeDuration", "numMemExtreme",
    "maxMemExtremeDuration", "memExtremeDuration", "bandGetsExtreme", "bandGetsLow", "numHostChoke",
    "raidSmartErrors", "internalUeccs", "maxMemLowDuration", "memLowDuration", "numFences",
    "raidFailedLbaMismatch", "indmbUnitsXfer", "indmbUnitsCache", "indmbUnitsInd",
    "RD_openBandCount", "RD_openBandNops", "RD_closedBandEvictCount", "RD_closedBandEvictSectors",
    "RD_closedBandFragmentCount", "RD_closedBandFragmentSectors", {"indmbXferCountTo_", 0, 1},
    {"indmbAccumulatedTimeBetweenXfers_", 0, 1}, "maxGracefulBootTimeMs", "maxUngracefulBootTimeMs",
    "averageGracefulBootTimeMs", "averageUngracefulBootTimeMs", "metaMismatchReread",
    "indmbUnitsTotal", {"readCountHisto_", 0, 4}, "indFlowPrograms", {"powerBudgetSelect_", 0, 3},
    "wcacheDS_SectorsMax", "wcacheDS_SectorsCur", "wcacheDS_Reads", "bandsRefreshedOnError",
    {"commitPadSectorsPerFlow_", 0, 3}, {"wcacheDSOverWrSizeByFlow_", 0, 3}, "indBandsPerFlow",
    {"clogPagesFillingPercentage_", 0, 3}, "bootChainRdError", {"bitflipAddr_", 0, 4},
    {"bitflipCount_", 0, 4}, {"bitflipDupes_", 0, 4}, "numFirmwareWrites", "numBisWrites",
    "numBootChainUpdates", "cntCalTimeWentBackWard", "numCrossTempUecc", "numOfAvoidedGCDueToTemp",
    "gcSlcDestinations", "raidFailedReadParity", "lhotFullLap", "lhotSkipPrecent",
    "AbortSkip_MPBXReadVerifyClosedBand", "openBandReadFail", "AbortSkip_MPBXReadVerifyOpenBand",
    "AbortSkip_MBPXFailedRebuildingParity", "raidSuccessfulPMXReconstructionInternal",
    "raidSuccessfulPMXReconstructionHost", "raidFailedPMXReconstructionInternal",
    "raidFailedPMXReconstructionHost", "raidSuccessfulRMXReconstructionInternal",
    "raidSuccessfulRMXReconstructionHost", "raidFailedRMXReconstructionInternal",
    "raidFailedRMXReconstructionHost", "raidFailedReadParityInternal",
    "raidFailedReadQParityInternal", "raidFailedReadQParity", "raidFailedReadQCopy",
    "raidFailedReconstructionQParity", "raidFailedReadBlog", "raidFailedReadQCopyInternal",
    {"raidReconstructSuccessFlow_", 0, 4}, {"raidReconstructFailFlow_", 0, 4},
    "raidReconstructFailP", "raidReconstructFailQ", "raidReconstructFailUECC",
    "raidReconstructFailUnsupp", "ueccReads", "directToTLCBands", "fwUpdatesPercentUsed",
    "slcPercentUsed", "percentUsed", "raidSLCPadding", "raidGCBands", "raidGCSectors",
    "raidGCPadding", "raidSLCBandsPerHostFlow", "raidSLCSecsPerHostFlow", "clogNumFastCxt",
    "clogNumRapidReboots", "clogFastCxtAbvThr", "rxBurnDiffModeRuns", "directToTLCSectors",
    "fallbackToWaterfall", "lockToTlc", {"raidReconstructSuccessPartition_", 0, 1},
    {"raidReconstructFailPartition_", 0, 1}, "raidUncleanBootBandFail",
    "raidReconstructFailBandFlowHost", "raidReconstructFailBandFlowGC", "maxFailedFastCxtSync",
    "numFormatUserArea", "clogFastCxtSyncAborted", "numFWUpdates", "numClogLoadFails",
    "maxVerticsInBand", "numVertics", "exceededCVertics", "firstFailedDieId", "numDieFailures",
    "spareAvailablePercent", "dataFabricErr", "downlinkFabricErr", "prpAccTimeoutErr",
    "HLT_intermediatePartitionSize", "HLT_formatWeeksSince2000", "HLT_storeDemoMode",
    "HLT_Reclaimer_totalPurgeable", "HLT_Reclaimer_totalNonPurgeable", "HLT_VMFreezer_bytesWritten",
    "numMemLow", {"clogOccupationSectors_", 0, 4}, "chipIdTemperatureSample",
    {"eanFirstReadMode_", 0, 1}, "HLT_APIErrorCode", "HLT_OR_Diskfullness_BP", "HLT_OR_Capacity_GB",
    "HLT_mspBootBlockReadFails_main", "HLT_mspBootBlockReadFails_backup",
    "HLT_mspBootBlockProgFails_main", "HLT_mspBootBlockProgFails_backup",
    "HLT_mspBootBlockEraseFails_main", "HLT_mspBootBlockEraseFails_backup",
    "HLT_numBootBlockRefreshes_max", "slowHwToTlc", "slowHwToSlc", "flushNwToSlc", "flushNwToTlc",
    "oslcHwGC", "oslcHwTT", "oslcHwNRP", "eanCompressWrites", "eanHostWrites", "eanHostUnmaps",
    "eanHostFlushes", "eanFastWrites", "raidReconstructFailMismatch", "skinnyRevectorSLC",
    "skinnyRevectorTLC", "uplinkFabricErr", "skinnyBandsGBB", "fastHwToTlcBurst",
    "slowHwFlushToSlc", "oslcHw", "oslcTransitions", "raidReconstructFailNoSPBX",
    "raidReconstructFailDouble", "oslcFastWAmpUOnOff", "raidReconstructFailInvalid",
    "raidFailedReadNoBlog", "raidReconstructFailBlank", "oslcHotTLCOnOff", "gcVPackDestinations",
    "averageTLCPECycles", "averageSLCPECycles", "raidExpectedFailRMXReconstructionInternal",
    "raidExpectedFailRMXReconstructionHost", "oslcGCinvalidations", "oslcGCActivateReason",
    "oslcLowCleanBandsUOnOff", "oslcTooManyGCMustOnOff", "oslcBdrBands", "oslcBdrValid",
    "waterfallLockSectors", "oslcGCActiveWrites", "gcVPackWrites", "eanMaxInitTimeMs",
    "eanMinToFirstReadTimeMs", "skinnyAPGMRetire", "fastHwToTlcBalance", "slcDemandBurstWritesInGC",
    "slcDemandBurstWritesInTT", "slcDemandBurstWritesInNRP", "eanAvgInitTimeMs",
    "eanAvgToFirstReadTimeMs", "eanMaxBootReadTimeMs", "eanAvgBootReadTimeMs", "maxBgInitTimeMs",
    "avgBgInitTimeMs", "eanMinBootReadMBPerSec", "eanAvgBootReadMBPerSec", "minSkinnyPECycles",
    "maxSkinnyPECycles", "averageSkinnyPECycles", {"raidSuccessfulRecoEAN_", 0, 3},
    {"raidFailedRecoEAN_", 0, 3}, "raidReconstructSuccessBandFlowOslc",
    "raidReconstructFailBandFlowOslc", "raidFailSectors", "eanFailSectors", "raidParityNotSavedP",
    "raidParityNotSavedQ", "raidParityInvalid", "raidParityUnknown", "raidParityUnmapped",
    "raidParityGCUnc", "AbortSkip_MPBXProbational", "raidVerificationReads", "powerOnHours",
    "powerOnSeconds", "bandPreErases", "autowriteDS2FSCollisions", "fastHwBurstToSlc",
    "slcDemandFlushCount", "slcDemandBurstCount", "wcacheSectorsCur", "wcacheSectorsMax",
    "wcacheSectorsMin", "nofDies", "non_proportional_directToTLCSectors", "boots", "skinnyBandsNum",
    "skinnyBandsNumDips", "logical_disk_occupied_promiles", "pcieClkreqHighTimeout",
    "HLT_OR_AmountDataAvailable_MB", "cbdrNotEnoughReads", "cbdrNumFastRefreshes",
    "cbdrNumSlowRefreshes", "cbdrPauseSent", "cbdrTotalRefreshValidity", "iBootNANDResets",
    "cbdrEarlyExits", "snapshotCPUHigh", "snapshotCPULow", "gcWithoutBMs", "eraseSuspendEvents",
    "eraseSuspendedStatuses", "raidReconstructFailBMXUnsup", "TurboRaidHostClassifications",
    "TurboRaidInternalClassifications", "raidPrevFailedReconstructSkip",
    "TurboRaidSuccessfulHostAuxReads", "TurboRaidSuccessfulInternalAuxReads",
    "turboRaidClassificationReliabilityHost", "turboRaidClassificationReliabilityInternal",
    "turboRaidClassificationQualityHost", "turboRaidClassificationQualityInternal",
    "TurboRaidFailedHostAuxReads", "TurboRaidFailedInternalAuxReads", "autoSkipTriggers",
    "autoSkipPlanes", "bandKill_userFlattenExcessive", "bandKill_IntFlattenExcessive",
    "bandKill_userFlattenBalance", "bandKill_intFlattenBalance", "bandKill_formatVertExcessive",
    "bandKill_formatVertBalance", "raidSuccessfulBMXReconstructionInternal",
    "raidSuccessfulBMXReconstructionHost", "raidFailedBMXReconstructionInternal",
    "raidFailedBMXReconstructionHost", "ricSPRVFail", "ricMPRVFail", "autoSkipRaidRecoFail",
    "raidReconstructFailBMXAbort", "bandKill_fatBindingNoBlocks", "bandKill_fatBindingFewBlocks",
    "raidReconstructFailBmxMp", "raidReconstructFailBmx", "raidReconstructFailBMXUECC",
    "raidReconstructFailBMXBlank", "raidPrevFailedReconstructBmxMpSkip", "numTLCFatBands",
    "fatValidity", "fatTotal", "raidBMXFailP", "raidBMXFailUECC", "raidBMXFailNoSPBX",
    "raidBMXFailBlank", "raidBMXFailUnsup", "raidBMXFailMpSkip", "raidBMXFailAbort",
    "TurboRaidIsEnabled", "raidBMXFailOther", "raidBMXSuccess", "skinnyBandsExtraDip",
    "bdrHostPingExtra", "bdrHostPingInitial", "bdrBackupChecks", "ricExceedClogOnlyPagesTH",
    "ricMaxClogOnlyPages", "nvme_stats_shutdown_count_host0_s2r", "HLT_UptimeInHrs",
    "HLT_VMStats_swapins", "HLT_VMStats_swapouts", "numDipFailures", "bdrBackupThreshHrs", "Count",
    // clang-format on
});

constexpr auto kFirstHistogramRanges = std::to_array<FieldRange>({
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

constexpr auto kSecondHistogramRanges = std::to_array<FieldRange>({
    // clang-format off
    "HLT_APIErrorCode", "HLT_averageSLCPECycles", "HLT_averageTLCPECycles",
    "HLT_formatWeeksSince2000", "HLT_hostWrites", "HLT_OR_Capacity_GB", "HLT_OR_Diskfullness_BP",
    {"numOfThrottlingEntriesPerLevel_", 0, 15}, {"raidReconstructDurationHisto_", 0, 7},
    {"failsOnReconstructHisto_", 0, 7}, {"bdrTmpHist_", 0, 63}, "Count",
    // clang-format on
});

constexpr auto kMSPEventRanges = std::to_array<FieldRange>({
    // clang-format off
    "msp_index", {"active_time_hist", 0, 7}, {"avg_rd_window_size", 0, 4},
    "bdbDefaultMoveFastToNormal", "bdbDefaultMoveNormalToFast", "bdbDynamicMovedToEOL_LSB",
    "bdbDynamicMovedToEOL_MSB", "bdbDynamicMovedToEOL_QSB", "bdbDynamicMovedToEOL_USB",
    "bdbDynamicMovedToSOL_LSB", "bdbDynamicMovedToSOL_MSB", "bdbDynamicMovedToSOL_QSB",
    "bdbDynamicMovedToSOL_USB", "boot_block_convert_to_main", "boot_block_erase_failures",
    "boot_block_program_failures", "boot_block_read_failures", "boot_block_read_source_changed",
    "boot_block_refresh", "boot_block_read_verify_failures", {"deepSoft1Decoded", 0, 9},
    {"deepSoft2Decoded", 0, 9}, "device_config", {"DYCE1_Decoded_Bitflips", 0, 14},
    {"DYCE1_Target_Bitflips", 0, 19}, {"DYCE2_Decoded_Bitflips", 0, 14},
    {"DYCE2_Target_Bitflips", 0, 19}, "firstReadWasFS2EOL", "firstReadWasFS2EOL_DSP",
    "firstReadWasHardWithAcq", "firstReadWasHardWithDefaultBDB",
    "firstReadWasHardWithDefaultBDBFastRead", {"FS1decodedbitflips", 0, 10},
    {"FS2decodedBitFlips", 0, 10}, {"higher_die_temperature", 0, 15}, "link_speed_recoveries",
    {"lower_die_temperature", 0, 15}, "maintenance_backup_to_main", "maintenance_main_to_backup",
    "num_zq_failures", "number_of_reset_failures", "number_of_sram_flips",
    "number_of_throttling_events", "numOfCwFailedInTmodeFS2_DSP_EOL", "numOfCwFailedInTmodeFS2_EOL",
    {"numOfSensesWereSentDuringMiniAcq", 0, 2}, {"numOfSensesWereSentDuringSyndSumAcq", 0, 4},
    "numOfSlipTracking", {"open_blocks_hist", 0, 6}, "passWithTmodeFS1_2b",
    "passWithTmodeFS1_2b_fast", "passWithTmodeFS1_4b", "passWithTmodeFS1_4b_fast",
    "passWithTmodeHard", "passWithTmodeHard_fast", {"random_read_hit_ratio_hist", 0, 5},
    {"readAlgoPassedThroughDS", 1, 2}, "readAlgoPassedThroughDS1_DSP",
    "readAlgoPassedThroughFS2_2b", "readAlgoPassedThroughFS2_2b_fast",
    "readAlgoPassedThroughFS2_4b", "readAlgoPassedThroughFS2_4b_fast", "readAlgoPassedThroughFS3",
    "readAlgoPassedThroughFS3_fast", "readAlgoPassedThroughSlip", "readAlgoPassedThroughSlip_fast",
    "readAlgoPassedThroughSyndSumAcquisition", {"readalgoPassWithDS", 1, 2},
    "readAlgoPassedThroughSyndSumAcquisition_DSP", "readalgoPassWithDS1_DSP",
    {"readalgoPassWithDYCE", 1, 2}, "readalgoPassWithDYCE1_DSP", "readalgoPassWithEXH",
    "readalgoPassWithEXH_DSP", "readAlgoPassWithFS12BitAfterAcq",
    "readAlgoPassWithFS12BitAfterSlip", "readAlgoPassWithFS12BitAfterSlip_fast",
    "readAlgoPassWithFS14BitAfterAcq", "readAlgoPassWithFS14BitAfterSlip",
    "readAlgoPassWithFS14BitAfterSlip_fast", "readAlgoPassWithFS2_4b",
    "readAlgoPassWithFS2_4b_fast", "readAlgoPassWithFS3", "readAlgoPassWithFS3_fast",
    "total_nof_msps", "syndSumAcqConvergedToStaticWalls",
    {"slipTrackingAfterFs1ForceFailChangedVthInTicksHist", 0, 3}, "readZeroPage", "readFail",
    "readErasedPage", "readAlgoPassWithHardAfterSlip_fast", "readAlgoPassWithHardAfterSlip",
    "readAlgoPassWithHardAfterAcq", "HLT_APIErrorCode", "HLT_averageSLCPECycles",
    "HLT_averageTLCPECycles", "HLT_formatWeeksSince2000", "HLT_hostWrites", "HLT_OR_Capacity_GB",
    "active_time_bw_pg_acc", {"active_time_bw_pg_hist", 0, 9}, "active_time_bw_pg_max",
    "active_time_bw_pg_min", {"auto_skip", 0, 4}, {"boot_time_low_power", 0, 4},
    {"boot_time_normal_power", 0, 4}, "cbdr_outlier", {"cbdr_ref_", 1, 2}, {"cbdr_step_", 10, 79},
    {"dspExceptionParameter", 115, 121}, {"dspExceptionParameter", 1000, 1003},
    {"dspExceptionParameter", 1010, 1013}, {"dspExceptionParameter", 1020, 1023},
    {"dspExceptionParameter", 1030, 1033}, {"dspExceptionParameter", 1040, 1043},
    {"dspExceptionParameter", 1050, 1053}, {"dspExceptionParameter", 1060, 1063},
    {"dspExceptionParameter", 1070, 1073}, {"dspExceptionParameter", 1080, 1083},
    {"dspExceptionParameter", 1090, 1093}, {"dspExceptionParameter", 1100, 1103},
    {"dspExceptionParameter", 1110, 1113}, {"dspExceptionParameter", 1120, 1123},
    {"dspExceptionParameter", 1130, 1133}, {"dspExceptionParameter", 1140, 1149},
    {"dspExceptionParameter", 1220, 1237}, {"dspExceptionParameter", 11410, 11419},
    {"dspExceptionParameter", 12210, 12219}, {"e2e_error_count_tmode", 0, 4},
    {"external_etags_usage_hist", 0, 6}, "gps_max_num_of_failures",
    "gps_num_of_failures_max_overflow", {"initialReadStage", 100, 104},
    {"initialReadStage", 200, 209}, {"initialReadStage", 211, 213},
    {"initialReadStage", 2100, 2103}, {"internal_etags_usage_hist", 0, 3}, "max_heap_usage",
    "max_size_open_blocks_list", {"mdll_relative_offset", 0, 4}, "msp_number_sram_flips",
    {"nandStageOfLife", 100, 104}, "num_auto_program_cache_terminations", "num_pg_events",
    "num_pg_regrets", "number_gracefull_read_terminations", "number_of_dcc_failures",
    "number_of_dcc_pass_after_retry", "number_of_read_cache_auto_terminations",
    {"random_read_size_ratio", 0, 4}, "readStage100", {"readStage", 102, 104}, "readStage200",
    {"readStage", 203, 208}, {"readStage", 211, 215}, {"readStage", 1010, 1013},
    {"readStage", 1050, 1053}, {"readStage", 1060, 1063}, {"readStage", 1070, 1073},
    {"readStage", 1080, 1083}, {"readStage", 1090, 1093}, {"readStage", 1100, 1103},
    {"readStage", 2010, 2013}, {"readStage", 2020, 2023}, {"readStage", 2090, 2093},
    {"readStage", 2100, 2103}, {"readStageNumOfErrorsBin", 1000, 1009},
    {"readStageNumOfErrorsBin", 10010, 10019}, {"readStageNumOfFails", 100, 101},
    {"readStageNumOfFails", 200, 203}, {"readStageNumOfFails", 1020, 1023},
    {"readStageNumOfFails", 1030, 1043}, {"readStageNumOfFails", 1050, 1053},
    {"readStageNumOfFails", 1060, 1063}, {"readStageNumOfFails", 1070, 1073},
    {"readStageNumOfFails", 1080, 1089}, {"readStageNumOfFails", 10310, 10363},
    {"readStageNumOfFails", 10810, 10863}, {"rom_num_hard_resets", 0, 5},
    "spi_image_cw_fetch_duration_acc", {"spi_image_cw_fetch_duration_hist", 0, 4},
    "spi_image_overall_duration_acc", "spi_num_uses", {"fw_version_identifier_", 0, 3},
    "fw_updates", {"rd_retraining_failures", 0, 1}, {"wr_retraining_failures", 0, 1},
    {"rd_retraining_failures_v", 20, 21}, {"extended_rd_window_diff_dist", 0, 8},
    {"rd_window_dist", 0, 8}, "Count",
    // clang-format on
});

constexpr auto kStorageEventRanges = std::to_array<FieldRange>({
    // clang-format off
    "EAN_updateCount_FW", "EAN_updateCount_LowPowerEM", "EAN_updateCount_NonEssentialFW",
    "EAN_updateCount_LTH", "EAN_updateCount_fConfig", "EAN_updateCount_dConfig",
    "EAN_updateCount_BIC", "EAN_imageSize_LTH", "EAN_imageSize_BIC", "HLT_APIErrorCode",
    "HLT_averageSLCPECycles", "HLT_averageTLCPECycles", "HLT_formatWeeksSince2000",
    "HLT_hostWrites", "HLT_OR_Capacity_GB", "HLT_OR_Diskfullness_BP", "Count",
    // clang-format on
});

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

}  // namespace

constinit const FieldTable massStorage_NANDInfo_FTLCounters_1 = fieldTable<kFTLEventRanges, 443>();

constinit const FieldTable massStorage_NANDInfo_FTLHistograms_1 =
    fieldTable<kFirstHistogramRanges, 990>();

constinit const FieldTable massStorage_NANDInfo_FTLHistograms_2 =
    fieldTable<kSecondHistogramRanges, 104>();

constinit const FieldTable massStorage_NANDInfo_MSPCounters_1 = fieldTable<kMSPEventRanges, 822>();

constinit const FieldTable massStorage_NANDInfo_StorageStats_1 =
    fieldTable<kStorageEventRanges, 17>();

constinit const FieldTable massStorage_NANDInfo_SM_Daily_FTLCounters_1 =
    fieldTable<kDailyRanges, 52>();

constinit const FieldTable massStorage_NANDInfo_SM_WeeklyMA_FTLCounters_1 =
    fieldTable<kWeeklyRanges, 33>();

constinit const FieldTable massStorage_NANDInfo_SM_Monthly_FTLCounters_1 =
    fieldTable<kMonthlyRanges, 33>();

}  // namespace vesprun
