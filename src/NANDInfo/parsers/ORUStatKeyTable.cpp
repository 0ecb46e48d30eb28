#include "NANDInfo/parsers/ORUStatKeyTable.h"

#include <algorithm>
#include <functional>

namespace vesprun {

// clang-format off
constexpr std::array<ORUStatKey, kORUStatKeyCount> ORUStatKeyTable = {{
    // 1 to 99
    {1, "version"}, {2, "hostWriteXacts"}, {3, "hostReadXacts"}, {4, "hostWrites"},
    {5, "hostWritesDyn"}, {6, "hostWritesStatic"}, {7, "hostReads"}, {8, "validLbas"},
    {9, "shutdowns"}, {10, "boots"}, {11, "uncleanBoots"}, {12, "IND_pool_free"},
    {13, "IND_pool_count"}, {14, "hostWriteLogHisto", 10}, {15, "hostReadLogHisto", 10},
    {16, "gcWrites"}, {17, "wearLevMoves"}, {18, "nandWrites"}, {19, "nandReads"},
    {20, "bandErases"}, {22, "numPfail"}, {23, "numEfail"}, {24, "numPerformanceRefreshes"},
    {27, "hostWritesMeta"}, {28, "numSleepOps"}, {30, "cntTimeWentBackWardOnBoot"},
    {31, "cntTimeWentBackWard"}, {34, "powerOnHours"}, {36, "smartCritWarnings"},
    {37, "numFlushes"}, {38, "numUnmap"}, {39, "numUnmapSec"}, {41, "clogProgram"},
    {42, "clogPFail"}, {43, "clogRead"}, {44, "clogRFail"}, {45, "maxHighEnduranceBlockErases"},
    {46, "numFactoryBad"}, {47, "numGrownBad"}, {48, "numFreeVirtualBlocks"}, {49, "bytesPerPage"},
    {50, "pagesPerVirtualBlock"}, {51, "blocksPerVirtualBlock"}, {52, "numVirtualBlocks"},
    {53, "exportVersion"}, {54, "ECBins", 100}, {55, "RCBins", 100}, {56, "utilFormatTime"},
    {57, "calendarTime"}, {58, "wallTime"}, {59, "cmdq_flush_us"}, {60, "cmdq_unmap_us"},
    {61, "cmdq_pri0_r_us"}, {62, "cmdq_pri0_w_us"}, {63, "cmdq_pri1_r_us"}, {64, "cmdq_pri1_w_us"},
    {65, "cmdq_pri2_r_us"}, {66, "cmdq_pri2_w_us"}, {67, "cmdq_pri3_r_us"}, {68, "cmdq_pri3_w_us"},
    {69, "host_idle_ms"}, {70, "cmd_hysteresis_window_us"}, {71, "cmd_lowPriHoldoffDelay_us"},
    {72, "cmd_lowPriHoldoffEnabled"}, {73, "cmd_expedite_num_success"},
    {75, "cmd_expedite_num_failures"}, {76, "num_trimerase"}, {77, "staticSizeInMB"},
    {80, "slcInvalidations"}, {81, "slcGCInvalidations"}, {82, "hostSectorsDuringGCon"},
    {83, "highWaterMarkSLCUsed"}, {84, "intermediateBandErases"},
    {85, "intermediatePartitionStart"}, {86, "userPartitionStart"}, {87, "iolog_lbas"},
    {88, "bandsAgeBins", 10}, {89, "intermediateBandsAgeBins", 10}, {90, "qosPerCmdQ", 160},
    {91, "maxQosPerCmdQ", 10}, {92, "shutdownDuringGC"}, {93, "numBandsRefreshedForAgePerTier", 3},
    {94, "bdrDeltaHot", 20}, {95, "numRefreshOnClockLoss"}, {96, "numRefreshOnErrNandRefreshRel"},
    {97, "numBGRefreshMoves"}, {98, "numBGPaddingMoves"}, {99, "hostWritesPhoto"},
    // 100 to 199
    {100, "INDPooldFree"}, {101, "INDContigCount"}, {102, "INDValidContigCount"},
    {103, "INDMinContigSize"}, {104, "INDMaxContigSize"}, {105, "INDAveContigSize"},
    {106, "INDpoolSize"}, {107, "pushSyncWrites"}, {109, "cmd_rw_hysteresis_us"},
    {110, "photoFlowMode"}, {112, "numBandsPaddedForAge"}, {113, "bandsPerHostFlow", 4},
    {114, "bandsPerSpecialFlow", 5}, {115, "secsPerHostFlow", 4}, {116, "secsPerSpecialFlow", 5},
    {118, "overWritesPerHostFlow", 4}, {119, "overWritesPerSpecialFlow", 5},
    {120, "padSectorsPerFlow", 10}, {121, "padSizes", 4}, {122, "unmapsPerHostFlow", 4},
    {123, "unmapsPerSpecialFlow", 5}, {124, "coldestCycle", 2}, {125, "hottestCycle", 2},
    {126, "gcLonlyWrites"}, {127, "gcPLWrites"}, {129, "pagesPerVirtualBlockSlc"},
    {130, "bdrPadding"}, {131, "errInjCounters", 8}, {132, "raidSuccessfulReconstructionInternal"},
    {133, "raidSuccessfulReconstructionHost"}, {134, "raidFailedReconstructionInternal"},
    {135, "raidFailedReconstructionHost"}, {136, "raidBandsPerHostFlow"},
    {137, "raidSecsPerHostFlow"}, {138, "gcFreeL"}, {139, "gcDestinations"}, {140, "gcFragments"},
    {141, "numMemChoke"}, {142, "maxMemChokeDuration"}, {143, "memChokeDuration"},
    {144, "numMemExtreme"}, {145, "maxMemExtremeDuration"}, {146, "memExtremeDuration"},
    {147, "bandGetsExtreme"}, {148, "bandGetsLow"}, {149, "numHostChoke"},
    {152, "AbortSkip_ProgramError"}, {153, "AbortSkip_ReadErrorOpenBand"},
    {154, "AbortSkip_FailedRebuildingParity"}, {155, "AbortPad_OpenRefreshBand"},
    {156, "AbortPad_CloseBands"}, {157, "AbortPad_SetPhoto"}, {158, "AbortPad_GcNoSource"},
    {159, "AbortPad_Format"}, {160, "nandDiscoveryDuration"}, {161, "coreCCEnableDuration"},
    {163, "coreOpenDuration"}, {164, "coreWritableDuration"}, {165, "coreClogLoadDuration"},
    {167, "bulkPFail"}, {169, "bulkRFail"}, {172, "raidSmartErrors"}, {182, "internalUeccs"},
    {183, "e2eFail"}, {184, "TempSensorMax"}, {185, "TempSensorMin"}, {186, "powerUpFromDDR"},
    {187, "numMemLow"}, {188, "maxMemLowDuration"}, {189, "memLowDuration"}, {190, "numFences"},
    {191, "hostPassiveIO"}, {192, "odtsMax"}, {193, "defragMFromOrphans"},
    {194, "defragMFromFragments"}, {195, "defragMTime"}, {196, "defragMMaxTime"},
    {197, "raidFailedLbaMismatch"}, {198, "numSyscfgWrites"}, {199, "indmbUnitsXfer"},
    // 200 to 299
    {200, "indmbUnitsCache"}, {201, "indmbUnitsInd"}, {202, "wcacheFS_Mbytes"},
    {203, "wcacheDS_Mbytes"}, {204, "powerOnSeconds"}, {205, "numUnknownTokenHostRead"},
    {206, "numUnmmapedTokenHostRead"}, {207, "numOfThrottlingEntriesPerLevel", 16},
    {208, "wcacheFS_MbytesMin"}, {209, "wcacheFS_MbytesMax"},
    {210, "prepareForShutdownFailCounter"}, {211, "lpsrEntry"}, {212, "lpsrExit"},
    {213, "crcInternalReadFail", 8}, {214, "wcacheFSEvictCnt"}, {215, "wcacheFSEvictSize"},
    {216, "wcacheFSWr"}, {217, "wcacheDSWr"}, {218, "wcacheFSEvictSizeLogDist", 10},
    {219, "prepareForShutdownTimeoutCounter"}, {220, "prepareForShutdownCancelCounter"},
    {221, "RD_openBandCount"}, {222, "RD_openBandNops"}, {223, "RD_closedBandEvictCount"},
    {224, "RD_closedBandEvictSectors"}, {225, "RD_closedBandFragmentCount"},
    {226, "RD_closedBandFragmentSectors"}, {227, "wcacheFSOverWrLogSizeCnts", 10},
    {228, "wcacheFSOverWrSizeByFlow", 4}, {229, "indmbXferCountTo", 2},
    {230, "indmbAccumulatedTimeBetweenXfers", 2}, {231, "maxGracefulBootTimeMs"},
    {232, "maxUngracefulBootTimeMs"}, {233, "averageGracefulBootTimeMs"},
    {234, "averageUngracefulBootTimeMs"}, {235, "gracefulBootTimeLogMs", 8},
    {236, "ungracefulBootTimeLogMs", 8}, {237, "CalibrationCount", 4}, {238, "CalibrationLastTmp"},
    {239, "CalibrationMaxTmp"}, {240, "CalibrationMinTmp"}, {241, "ungracefulBootWorstIndicator"},
    {242, "metaMismatchReread"}, {243, "numS3SleepOps"}, {244, "odtsCurrent"},
    {245, "prefetchReads"}, {246, "prefetchHits"}, {247, "prefetchWritesInvalidation"},
    {248, "indmbUnitsTotal"}, {249, "selfThrottlingEngage"}, {250, "selfThrottlingDisengage"},
    {252, "AbortSkip_WlpMode"}, {253, "hostWritesWlpMode"}, {254, "numClogDoubleUnc"},
    {256, "AbortPad_WlpMode"}, {257, "bonfireIntermediateBandErases"},
    {258, "bonfireUserBandErases"}, {259, "bonfireIntermediateBandProgs"},
    {260, "bonfireUserBandProgs"}, {261, "bonfireIntermediatePageReads"},
    {262, "bonfireUserPageReads"}, {263, "refreshUtil00"}, {264, "failToReadUtil00"},
    {265, "readCountHisto", 5}, {266, "readAmpHisto", 16}, {267, "totalReadAmp"},
    {268, "nvmeModeSelect", 4}, {269, "numBootBlockRefreshSuccess", 8},
    {270, "numBootBlockRefreshFail", 8}, {271, "numUnsupportedAsi"},
    {272, "NumTerminatedProgramSegs"}, {273, "indParityPagesDrops"}, {274, "indFlowPrograms"},
    {277, "powerBudgetSelect", 4}, {279, "RxBurnNandWrites"}, {280, "E2EDPErrorCounters", 12},
    {281, "wcacheSectorsMax"}, {282, "wcacheSectorsMin"}, {283, "wcacheSectorsCur"},
    {284, "wcacheDS_SectorsMax"}, {285, "wcacheDS_SectorsMin"}, {286, "wcacheDS_SectorsCur"},
    {287, "wcacheFS_Reads"}, {288, "wcacheDS_Reads"}, {289, "mspBootBlockReadFail", 32},
    {290, "mspBootBlockProgFail", 32}, {291, "mspBootBlockEraseFail", 32},
    {292, "bandsRefreshedOnError"}, {298, "perHostReads", 2}, {299, "perHostReadXacts", 2},
    // 300 to 399
    {300, "perHostWrites", 2}, {301, "perHostWriteXacts", 2}, {302, "perHostNumFlushes", 2},
    {303, "perHostNumFences", 2}, {304, "commitPadSectorsPerFlow", 10},
    {305, "wcacheDSOverWrLogSizeCnts", 10}, {306, "wcacheDSOverWrSizeByFlow", 4},
    {307, "CmdRaisePrioiryEvents", 10}, {308, "utilNumVerification"}, {309, "utilRefreshes"},
    {310, "utilBDRErrors"}, {311, "indBandsPerFlow"}, {312, "secsPerIndFlow"},
    {313, "indDecodedECC"}, {314, "numBootBlockValidateSuccess", 8},
    {315, "numBootBlockValidateFail", 8}, {316, "clogPagesFillingPercentage", 4},
    {317, "bdrCalTimeAccFactor"}, {318, "bootChainRdError"}, {319, "bootChainBlankError"},
    {320, "bootChainRefreshError"}, {321, "bootChainVersionError"}, {322, "mspBootBlockMismatch"},
    {323, "mspBootBlockMismatchErr"}, {324, "bitflipAddr", 5}, {325, "bitflipCount", 5},
    {326, "bitflipDupes", 5}, {327, "bandsMaxTempHisto", 22}, {328, "bandsMinTempHisto", 22},
    {329, "bandsLifeTimeTempHisto", 30}, {330, "bandsDeltaTempHisto", 22},
    {331, "bandsCrossTempHisto", 45}, {332, "wcacheWaitLogMs", 10},
    {333, "wcacheDS_segsSortedLogSize", 10}, {334, "numFirmwareWrites"}, {335, "numBisWrites"},
    {336, "numBootChainUpdates"}, {337, "cntCalTimeWentBackWard"}, {338, "indBoRecoveries"},
    {340, "numCrossTempUecc"}, {341, "latencyMonitorError"}, {343, "utilUeccReads"},
    {344, "numOfAvoidedGCDueToTemp"}, {345, "forceShutdowns"}, {346, "gcSlcDestinations"},
    {347, "indReplayExtUsed"}, {348, "defectsPerPackageOverflow"},
    {349, "RxBurnIntBandsProgrammed"}, {350, "RxBurnUsrBandsProgrammed"},
    {351, "RxBurnIntNandWrites"}, {352, "RxBurnUsrNandWrites"}, {353, "clogLastStripeUeccs"},
    {354, "GC_MidDestSrcSwitchSLC2TLC"}, {355, "GC_MidDestSrcSwitchTLC2SLC"},
    {356, "nvme_stats_shutdown_count_host0_normal"},
    {357, "nvme_stats_shutdown_count_host1_normal"}, {358, "nvme_stats_shutdown_count_host0_s2r"},
    {359, "nvme_stats_shutdown_count_host1_s2r"}, {360, "gcPDusterIntrSrcValidityHisto", 16},
    {361, "gcPDusterUserSrcValidityHisto", 16}, {362, "raidFailedReadParity"},
    {364, "lhotNumSkipes"}, {365, "lhotNumIsHotCalls"}, {366, "lhotFullLap"},
    {367, "lhotSkipPrecent"}, {368, "eraseSuspendEvents"}, {369, "eraseSuspendedStatuses"},
    {370, "eraseSuspendedBands"}, {371, "eraseSuspendSituationsBelowThreshold"},
    {372, "eraseSuspendSituationsAboveThreshold"}, {373, "eraseSuspendReadChainsProcessed"},
    {374, "bdrLastDoneHr"}, {375, "bdrBackupThreshHrs"}, {376, "clogPortableProgBufs"},
    {377, "clogPortableDropBufs"}, {378, "clogPortablePadSectors"}, {379, "numRetiredBlocks"},
    {381, "numRefreshOnErrNandRefreshPerf"}, {382, "raidReconstructReads"}, {383, "gcReadsNoBlog"},
    {384, "AbortSkip_MPBXReadVerifyClosedBand"}, {385, "openBandReadFail"},
    {386, "AbortSkip_MPBXReadVerifyOpenBand"}, {387, "AbortSkip_MBPXFailedRebuildingParity"},
    {388, "raidSuccessfulPMXReconstructionInternal"}, {389, "raidSuccessfulPMXReconstructionHost"},
    {390, "raidFailedPMXReconstructionInternal"}, {391, "raidFailedPMXReconstructionHost"},
    {392, "raidSuccessfulRMXReconstructionInternal"}, {393, "raidSuccessfulRMXReconstructionHost"},
    {394, "raidFailedRMXReconstructionInternal"}, {395, "raidFailedRMXReconstructionHost"},
    {396, "raidFailedReadParityInternal"}, {397, "raidFailedReadQParityInternal"},
    {398, "raidFailedReadQParity"}, {399, "raidFailedReadQCopy"},
    // 400 to 499
    {400, "raidFailedReconstructionQParity"}, {401, "offlineBlocksCnt"}, {402, "bork0Revectors"},
    {403, "raidFailedReadBlog"}, {404, "numReliabilityRefreshes"},
    {405, "raidFailedReadQCopyInternal"}, {406, "raidReconstructSuccessFlow", 5},
    {407, "raidReconstructFailFlow", 5}, {408, "raidReconstructFailP"},
    {409, "raidReconstructFailQ"}, {410, "raidReconstructFailUECC"},
    {411, "raidReconstructFailUnsupp"}, {412, "raidUECCOpenBand"}, {414, "ueccReads"},
    {416, "raidSuccessfulVerify"}, {417, "raidFailedVerify"}, {418, "numBandsVerified"},
    {419, "cache_heads"}, {420, "AbortSkip_RMXtoMPBX"}, {421, "kx3FwVer"},
    {422, "readVerifyNative"}, {423, "reducedReadVerifyNative"}, {424, "readVerifySlc"},
    {425, "reducedReadVerifySlc"}, {426, "RxBurnEvictions"}, {427, "directToTLCBands"},
    {428, "nandDesc"}, {429, "fwUpdatesPercentUsed"}, {430, "slcPercentUsed"}, {431, "percentUsed"},
    {432, "hostAutoWrites"}, {433, "hostAutoWriteXacts"}, {434, "gcDestDynamic"},
    {435, "gcDestStatic"}, {436, "gcDestWearlevel"}, {437, "gcDestParity"},
    {438, "AbortSkip_Format"}, {440, "raidSLCPadding"}, {441, "raidGCBands"},
    {442, "raidGCSectors"}, {443, "raidGCPadding"}, {444, "raidSLCBandsPerHostFlow"},
    {445, "raidSLCSecsPerHostFlow"}, {446, "rxBurnMinCycleRuns"}, {447, "clogNumFastCxt"},
    {448, "clogNumRapidReboots"}, {449, "clogFastCxtAbvThr"}, {450, "rxBurnDiffModeRuns"},
    {452, "indReadVerifyFail"}, {453, "numOfThrottlingEntriesPerReadLevel", 16},
    {454, "numOfThrottlingEntriesPerWriteLevel", 16}, {456, "slcFifoDepth", 10},
    {457, "wcacheSectorsDirtyIdle"}, {458, "wcacheDS_SectorsDirtyIdle"},
    {459, "wcacheFS_MbytesDirtyIdle"}, {460, "CacheDepthVsThroughput", 256},
    {461, "directToTLCSectors"}, {462, "fallbackToWaterfall"},
    {463, "balanceProportionBucketsHistogram", 11}, {464, "lockToTlc"},
    {465, "burstSizeHistogram", 10}, {466, "qosDirectToTLC", 64}, {467, "maxQosDirectToTLC", 4},
    {468, "wcacheDirtyAtFlush", 16}, {469, "raidReconstructSuccessPartition", 2},
    {470, "raidReconstructFailPartition", 2}, {471, "raidUncleanBootBandFail"},
    {472, "raidReconstructFailBandFlowHost"}, {473, "raidReconstructFailBandFlowGC"},
    {476, "raidSuccessfulRecoLbaRange", 2}, {477, "raidFailedRecoLbaRange", 2},
    {481, "skinnyBandErases", 32}, {483, "tlcOverHeatWaterfall"}, {484, "skinnyCyclesConvert"},
    {485, "non_proportional_directToTLCSectors"}, {486, "maxFailedFastCxtSync"},
    {487, "numFormatUserArea"}, {488, "clogFastCxtSyncAborted"}, {489, "clogOccupationSectors", 5},
    {490, "bdrTmpHist", 64}, {491, "numFWUpdates"}, {492, "numClogLoadFails"},
    {493, "rxBurnNumForcedDiffMode"}, {494, "RD_numSaves"}, {495, "eanCompressWrites"},
    {496, "eanHostWrites"}, {497, "bandPreErases"}, {498, "eanHostUnmaps"}, {499, "eanHostFlushes"},
    // 500 to 599
    {500, "eanFastWrites"}, {501, "autowriteDS2FSCollisions"},
    {502, "autowriteWaitTransferTaskBlocks"}, {503, "avgCycle", 2},
    {504, "RD_DeferredClearsOverflowCnt"}, {505, "maxVerticsInBand"}, {506, "numVertics"},
    {507, "exceededCVertics"}, {510, "raidReconstructFailMismatch"},
    {511, "mspbootBlockRefreshCnt", 32}, {516, "mspBootBlockRefreshTime", 32},
    {517, "mspBootBlockCountPerMsp"}, {518, "skinnyRevectorSLC"}, {519, "skinnyRevectorTLC"},
    {520, "perfSetupAttempts"}, {521, "perfSetupSuccesses"}, {522, "perfWriteAttempts"},
    {523, "perfWriteSuccesses"}, {524, "perfReadAttempts"}, {525, "perfReadSuccesses"},
    {526, "perfCleanupAttempts"}, {527, "perfCleanupSuccesses"}, {530, "firstFailedDieId"},
    {531, "numDieFailures"}, {532, "spareAvailablePercent"}, {533, "dataFabricErr"},
    {534, "downlinkFabricErr"}, {535, "prpAccTimeoutErr"}, {537, "uplinkFabricErr"},
    {538, "skinnyBandsGBB"}, {539, "AbortPad_GcMustPadBand"}, {540, "AbortPad_GcMustPadSkinny"},
    {541, "bdrHostPingInitial"}, {542, "bdrHostPingMoreNeeded"},
    {543, "bandParityAllocationFailed"}, {544, "fastHwBurstToSlc"}, {545, "slowHwToTlc"},
    {546, "slcDemandBurstSizeDetected", 10}, {547, "slcDemandBurstDur", 10},
    {548, "fastHwToTlcBurst"}, {549, "slcDemandBurstSizeSlc", 10},
    {551, "balanceProportionBucketsHistogramTlc", 11}, {553, "slowHwFlushToSlc"},
    {557, "slowHwToSlc"}, {558, "flushNwToSlc"}, {559, "flushNwToTlc"}, {560, "oslcHw"},
    {561, "oslcTransitions"}, {563, "slcDemandFlushCount"}, {564, "slcDemandBurstCount"},
    {565, "oslcBaseAvgPE"}, {566, "raidReconstructFailNoSPBX"}, {567, "raidReconstructFailDouble"},
    {568, "oslcFastWAmpUOnOff"}, {569, "oslcSlowWAmpUOnOff"}, {570, "raidReconstructFailInvalid"},
    {572, "oslcLastWAmpUx10"}, {573, "raidFailedReadNoBlog"}, {574, "raidReconstructFailBlank"},
    {575, "oslcHotTLCOnOff"}, {576, "gcVPackDestinations"}, {581, "averageTLCPECycles"},
    {582, "averageSLCPECycles"}, {583, "numAtomicBoots"}, {584, "clogMinorMismatch"},
    {586, "raidExpectedFailRMXReconstructionInternal"},
    {587, "raidExpectedFailRMXReconstructionHost"}, {588, "oslcGCinvalidations"},
    {589, "oslcGCActivateReason"}, {590, "oslcLowCleanBandsUOnOff"},
    {591, "oslcTooManyGCMustOnOff"}, {592, "oslcBaseHostWrites"}, {593, "oslcBaseBandErases"},
    {594, "oslcBdrBands"}, {595, "oslcBdrValid"}, {596, "unexpectedBlanks"},
    {597, "unexpectedBlanksOnRV"},
    // 600 to 699
    {601, "waterfallLockSectors"}, {602, "oslcGCActiveWrites"}, {603, "chipIdTemperatureSample"},
    {604, "gcVPackWrites"}, {605, "gcActiveReasons", 10}, {606, "eanMaxInitTimeMs"},
    {607, "eanMinToFirstReadTimeMs"}, {608, "skinnyAPGMRetire"}, {609, "unexpectedBlanksHost"},
    {610, "pcieAerCounters", 64}, {611, "fastHwToTlcBalance"}, {612, "perfOSLCRuns"},
    {613, "slcDemandBurstWritesInGC"}, {614, "slcDemandBurstWritesInTT"},
    {615, "slcDemandBurstWritesInNRP"}, {616, "perfTotalDmaMb"}, {617, "eanAvgInitTimeMs"},
    {618, "eanAvgToFirstReadTimeMs"}, {619, "eanMaxBootReadTimeMs"}, {620, "eanAvgBootReadTimeMs"},
    {621, "eanBootReadsHist", 10}, {622, "maxBgInitTimeMs"}, {623, "avgBgInitTimeMs"},
    {624, "clogFailReason", 16}, {625, "eanMinBootReadMBPerSec"}, {626, "eanAvgBootReadMBPerSec"},
    {627, "minSkinnyPECycles"}, {628, "maxSkinnyPECycles"}, {629, "averageSkinnyPECycles"},
    {630, "raidSuccessfulRecoEAN", 6}, {631, "raidFailedRecoEAN", 6}, {632, "eanFirstReadMode", 6},
    {635, "oslcHwGC"}, {636, "oslcHwTT"}, {637, "oslcHwNRP"}, {638, "oslcDemandBurstSize", 10},
    {639, "raidReconstructSuccessBandFlowOslc"}, {640, "raidReconstructFailBandFlowOslc"},
    {641, "raidFailSectors"}, {642, "eanFailSectors"}, {643, "bdrTimeMode"},
    {644, "raidParityNotSavedP"}, {645, "raidParityNotSavedQ"}, {646, "raidParityInvalid"},
    {647, "raidParityUnknown"}, {648, "raidParityUnmapped"}, {649, "raidParityGCUnc"},
    {657, "AbortSkip_MPBXProbational"}, {659, "raidVerificationReads"}, {666, "nofDies"},
    {671, "skinnyBandsNum"}, {672, "skinnyBandsNumDips"}, {674, "oslcNoVotesHw", 8},
    {676, "bdrHostPingExtra"}, {677, "magazineInstanceMeta"}, {680, "magazineFWVersion", 3},
    {682, "raidReconstructFailBMXUnsup"}, {683, "iBootNANDResets"}, {684, "pcieClkreqHighTimeout"},
    {687, "cbdrInitSent", 3}, {688, "cbdrPauseSent"}, {691, "cbdrEarlyExits"},
    {694, "cbdrRefreshGrades", 10}, {695, "cbdrNotEnoughReads"},
    {697, "TurboRaidHostClassifications"}, {698, "TurboRaidInternalClassifications"},
    // 700 to 799
    {702, "vcurve", 32}, {703, "injDepth", 12}, {704, "logical_disk_occupied_promiles"},
    {711, "raidPrevFailedReconstructSkip"}, {712, "TurboRaidSuccessfulHostAuxReads"},
    {713, "TurboRaidSuccessfulInternalAuxReads"}, {714, "turboRaidClassificationReliabilityHost"},
    {715, "turboRaidClassificationReliabilityInternal"},
    {716, "turboRaidClassificationQualityHost"}, {717, "turboRaidClassificationQualityInternal"},
    {737, "TurboRaidFailedHostAuxReads"}, {738, "TurboRaidFailedInternalAuxReads"},
    {741, "autoSkipTriggers"}, {742, "autoSkipPlanes"}, {744, "raidReconstructDurationHisto", 8},
    {745, "failsOnReconstructHisto", 8}, {746, "bandKill_userFlattenExcessive"},
    {747, "bandKill_IntFlattenExcessive"}, {748, "bandKill_userFlattenBalance"},
    {749, "bandKill_intFlattenBalance"}, {750, "bandKill_formatVertExcessive"},
    {751, "bandKill_formatVertBalance"}, {753, "cbdrNumSlowRefreshes"},
    {754, "cbdrNumFastRefreshes"}, {755, "cbdrTotalRefreshValidity"}, {756, "cbdrRefreshedAges", 9},
    {759, "cbdrScanPct", 5}, {760, "raidSuccessfulBMXReconstructionInternal"},
    {761, "raidSuccessfulBMXReconstructionHost"}, {762, "raidFailedBMXReconstructionInternal"},
    {763, "raidFailedBMXReconstructionHost"}, {764, "ricSPRVFail"}, {765, "ricMPRVFail"},
    {768, "cbdrRefreshedAgesSLC", 9}, {770, "cpuBurstLength", 8}, {771, "autoSkipRaidRecoFail"},
    {772, "dmReasonsSlc", 32}, {773, "dmReasonsTlc", 32}, {774, "raidReconstructFailBMXAbort"},
    {775, "bandKill_fatBindingNoBlocks"}, {776, "bandKill_fatBindingFewBlocks"},
    {777, "numBadBootBlocks"}, {778, "snapshotCPUHigh"}, {779, "snapshotCPULow"},
    {780, "gcWithoutBMs"}, {781, "gcSearchTimeHistory", 10}, {785, "gcSearchPortion", 16},
    {786, "raidReconstructFailBmxMp"}, {787, "raidReconstructFailBmx"},
    {788, "raidReconstructFailBMXUECC"}, {789, "raidReconstructFailBMXBlank"},
    {790, "raidPrevFailedReconstructBmxMpSkip"}, {792, "numTLCFatBands"}, {793, "fatValidity"},
    {794, "fatTotal"}, {798, "raidBMXFailP"}, {799, "raidBMXFailUECC"},
    // 800 to 899
    {804, "raidBMXFailNoSPBX"}, {806, "raidBMXFailBlank"}, {809, "raidBMXFailUnsup"},
    {811, "raidBMXFailMpSkip"}, {812, "raidBMXFailAbort"}, {813, "TurboRaidIsEnabled"},
    {814, "raidBMXFailOther"}, {815, "raidBMXSuccess"}, {816, "skinnyBandsExtraDip"},
    {821, "writeAmp"}, {822, "ricMaxClogOnlyPages"}, {826, "bdrBackupChecks"},
    {827, "ricExceedClogOnlyPagesTH"}, {828, "numDipFailures"},
}};
// clang-format on

namespace {

constexpr std::size_t kLargestKnownId = 828;
constexpr std::uint16_t kNoRow = 0xFFFF;

constexpr std::array<std::uint16_t, kLargestKnownId + 1> kRowOfId = [] {
  std::array<std::uint16_t, kLargestKnownId + 1> rows{};
  rows.fill(kNoRow);
  for (std::size_t row = 0; row < ORUStatKeyTable.size(); ++row) {
    rows[ORUStatKeyTable[row].id] = static_cast<std::uint16_t>(row);
  }
  return rows;
}();

constexpr std::size_t kArrays = std::ranges::count_if(ORUStatKeyTable, &ORUStatKey::isArray);
constexpr std::size_t kElements = [] {
  std::size_t elements = 0;
  for (const ORUStatKey& key : ORUStatKeyTable) {
    elements += key.count;
  }
  return elements;
}();

static_assert(kArrays == 117 && kElements == kORUStatKeyCount - kArrays + 1956);
static_assert(std::ranges::adjacent_find(ORUStatKeyTable, std::ranges::greater_equal(),
                                         &ORUStatKey::id) == ORUStatKeyTable.end());
static_assert(ORUStatKeyTable.back().id == kLargestKnownId);

constexpr char kBaseSeparator[] = "";
constexpr char kFTLSeparator[] = "_";

}  // namespace

KnownNames baseNamesOf(const ORUStatKey& row) {
  return KnownNamesOf<ORUStatKeyTable, kBaseSeparator>::of(row);
}

KnownNames FTLNamesOf(const ORUStatKey& row) {
  return KnownNamesOf<ORUStatKeyTable, kFTLSeparator>::of(row);
}

const ORUStatKey* findORUStatKey(std::uint32_t id) {
  const std::uint16_t row = id < kRowOfId.size() ? kRowOfId[id] : kNoRow;
  return row != kNoRow ? &ORUStatKeyTable[row] : nullptr;
}

}  // namespace vesprun
