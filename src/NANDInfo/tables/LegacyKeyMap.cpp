#include "NANDInfo/tables/LegacyKeyMap.h"

#include <algorithm>
#include <array>
#include <cstddef>

namespace vesprun {
namespace {

/// Fields and, number for number, the suffixes of their keys.
struct KeyRange {
  FieldRange fields;
  FieldRange suffixes;

  consteval KeyRange(FieldRange both) : KeyRange(both, both) {}
  consteval KeyRange(FieldRange fieldRange, FieldRange suffixRange)
      : fields(fieldRange), suffixes(suffixRange) {
    if (fields.size() != suffixes.size()) {
      throw "every field has one suffix";
    }
  }
};

constexpr auto kRows = std::to_array<KeyRange>({
    // clang-format off
    {{"numMemChoke"}},
    {{"maxMemChokeDuration"}},
    {{"memChokeDuration"}},
    {{"numMemExtreme"}},
    {{"commitPadSectorsPerFlow", 0, 3}},
    {{"RD_openBandCount"}},
    {{"RD_openBandNops"}},
    {{"RD_closedBandEvictCount"}},
    {{"RD_closedBandEvictSectors"}},
    {{"RD_closedBandFragmentCount"}},
    {{"RD_closedBandFragmentSectors"}},
    {{"numCrossTempUecc"}},
    {{"wcacheDS_SectorsMax"}},
    {{"wcacheDS_SectorsCur"}},
    {{"wcacheDSOverWrLogSizeCnts", 0, 9}},
    {{"wcacheDSOverWrSizeByFlow", 0, 3}},
    {{"wcacheWaitLogMs", 0, 9}},
    {{"wcacheDS_segsSortedLogSize", 0, 9}},
    {{"indmbXferCountTo", 0, 1}},
    {{"indmbAccumulatedTimeBetweenXfers", 0, 1}},
    {{"indmbUnitsTotal"}},
    {{"indmbUnitsXfer"}},
    {{"indmbUnitsCache"}},
    {{"indmbUnitsInd"}},
    {{"gcDestinations"}},
    {{"gcSlcDestinations"}},
    {{"lhotFullLap"}},
    {{"raidSuccessfulPMXReconstructionInternal"}},
    {{"raidSuccessfulPMXReconstructionHost"}},
    {{"raidFailedPMXReconstructionInternal"}},
    {{"raidFailedPMXReconstructionHost"}},
    {{"raidSuccessfulRMXReconstructionInternal"}},
    {{"raidSuccessfulRMXReconstructionHost"}},
    {{"raidFailedRMXReconstructionInternal"}},
    {{"raidFailedRMXReconstructionHost"}},
    {{"AbortSkip_MPBXReadVerifyClosedBand"}},
    {{"AbortSkip_MPBXReadVerifyOpenBand"}},
    {{"AbortSkip_MBPXFailedRebuildingParity"}},
    {{"openBandReadFail"}},
    {{"raidFailedReadQParity"}},
    {{"kx3FwVer"}},
    {{"nandDesc"}},
    {{"numFirmwareWrites"}},
    {{"numBisWrites"}},
    {{"hostWritesDyn"}},
    {{"hostWritesStatic"}},
    {{"hostWritesMeta"}},
    {{"hostWritesPhoto"}},
    {{"ueccReads"}},
    {{"internalUeccs"}},
    {{"numPfail"}},
    {{"numEfail"}},
    {{"numGrownBad"}},
    {{"wcacheDirtyAtFlush", 0, 15}},
    {{"clogNumFastCxt"}},
    {{"clogNumRapidReboots"}},
    {{"clogFastCxtAbvThr"}},
    {{"raidGCPadding"}},
    {{"raidSLCPadding"}},
    {{"raidGCBands"}},
    {{"raidGCSectors"}},
    {{"raidSLCBandsPerHostFlow"}},
    {{"raidSLCSecsPerHostFlow"}},
    {{"maxFailedFastCxtSync"}},
    {{"raidReconstructSuccessPartition1"}},
    {{"raidReconstructFailPartition1"}},
    {{"clogFastCxtSyncAborted"}},
    {{"powerBudgetSelect", 0, 3}},
    {{"numFWUpdates"}},
    {{"indFlowPrograms"}},
    {{"numClogLoadFails"}},
    {{"directToTLCBands"}},
    {{"directToTLCSectors"}},
    {{"fallbackToWaterfall"}},
    {{"lockToTlc"}},
    {{"burstSizeHistogram", 0, 9}},
    {{"balanceProportionBucketsHistogram", 0, 10}},
    {{"CacheDepthVsThroughput", 0, 255}},
    {{"slcInvalidations"}},
    {{"clogPagesFillingPercentage", 0, 3}},
    {{"fwUpdatesPercentUsed"}},
    {{"indBandsPerFlow"}},
    {{"raidSecsPerHostFlow"}},
    {{"raidSmartErrors"}},
    {{"pagesPerVirtualBlockSlc"}},
    {{"maxVerticsInBand"}},
    {{"numVertics"}},
    {{"exceededCVertics"}},
    {{"cntCalTimeWentBackWard"}},
    {{"maxGracefulBootTimeMs"}},
    {{"maxUngracefulBootTimeMs"}},
    {{"averageGracefulBootTimeMs"}},
    {{"averageUngracefulBootTimeMs"}},
    {{"gracefulBootTimeLogMs", 0, 7}},
    {{"ungracefulBootTimeLogMs", 0, 7}},
    {{"numDieFailures"}},
    {{"spareAvailablePercent"}},
    {{"firstFailedDieId"}},
    {{"padSectorsPerFlow4"}},
    {{"clogProgram"}},
    {{"prpAccTimeoutErr"}},
    {{"downlinkFabricErr"}},
    {{"dataFabricErr"}},
    {{"numBootChainUpdates"}},
    {{"bootChainRdError"}},
    {{"rxBurnDiffModeRuns"}},
    {{"raidReconstructSuccessFlow", 0, 4}},
    {{"raidReconstructFailFlow", 0, 4}},
    {{"numFormatUserArea"}},
    {{"raidUncleanBootBandFail"}},
    {{"raidReconstructFailP"}},
    {{"raidReconstructFailQ"}},
    {{"raidReconstructFailUECC"}},
    {{"raidReconstructFailUnsupp"}},
    {{"raidReconstructFailBandFlowHost"}},
    {{"raidReconstructFailBandFlowGC"}},
    {{"raidFailedReadBlog"}},
    {{"raidFailedReconstructionQParity"}},
    {{"raidFailedReadQCopy"}},
    {{"raidFailedReadQCopyInternal"}},
    {{"raidFailedReadParity"}},
    {{"raidFailedReadParityInternal"}},
    {{"raidFailedReadQParityInternal"}},
    {{"intermediateBandErases"}, {"IntermediateBandErases"}},
    {{"numFlushes"}, {"NumFlushes"}},
    {{"numFences"}, {"NumFences"}},
    {{"numHostChoke"}, {"NumHostChoke"}},
    {{"uncleanBoots"}, {"UncleanBoots"}},
    {{"metaMismatchReread"}, {"MetaMismatchReread"}},
    {{"numOfAvoidedGCDueToTemp"}, {"NumOfAvoidedGCDueToTemp"}},
    {{"staticSizeInMB"}, {"StaticDataSizeInMB"}},
    {{"bdrPadding"}, {"AgeInducedWriteSectors"}},
    {{"cntTimeWentBackWardOnBoot"}, {"NumClockLoss"}},
    {{"numRefreshOnClockLoss"}, {"NumRefreshesOnClockLoss"}},
    {{"numBandsRefreshedForAgePerTier", 0, 2}, {"NumRefreshesTier", 0, 2}},
    {{"numBandsPaddedForAge"}, {"NumPaddingsForAge"}},
    {{"bandsRefreshedOnError"}, {"NumBandsRefreshedOnError"}},
    {{"secsPerHostFlow", 0, 3}, {"SectorsPerHostFlow", 0, 3}},
    {{"maxMemLowDuration"}, {"maxMemExtremeDuration"}},
    {{"memLowDuration"}, {"memExtremeDuration"}},
    {{"bandGetsExtreme"}, {"NumBandGetsExtreme"}},
    {{"bandGetsLow"}, {"NumBandGetsLow"}},
    {{"padSectorsPerFlow", 0, 3}, {"PadSectorsPerHostFlow", 0, 3}},
    {{"bandsPerHostFlow", 0, 3}, {"BandsPerHostFlow", 0, 3}},
    {{"bandsPerSpecialFlow", 0, 2}, {"BandsPerInternalFlow", 0, 2}},
    {{"bandsPerSpecialFlow4"}, {"BandsPerInternalFlow3"}},
    {{"coldestCycle0"}, {"ColdestCycle"}},
    {{"hottestCycle0"}, {"HottestCycle"}},
    {{"coldestCycle1"}, {"IntermediateColdestCycle"}},
    {{"hottestCycle1"}, {"IntermediateHottestCycle"}},
    {{"overWritesPerHostFlow", 0, 3}, {"OverWritesPerHostFlow", 0, 3}},
    {{"overWritesPerSpecialFlow", 0, 2}, {"OverWritesPerInternalFlow", 0, 2}},
    {{"unmapsPerHostFlow", 0, 3}, {"UnmapsPerHostFlow", 0, 3}},
    {{"unmapsPerSpecialFlow", 0, 2}, {"UnmapsPerInternalFlow", 0, 2}},
    {{"padSizes", 0, 3}, {"PadSize", 1, 4}},
    {{"gcWrites"}, {"NumGCWrites"}},
    {{"gcPLWrites"}, {"NumGCPLWrites"}},
    {{"gcLonlyWrites"}, {"NumLOnlyGCWrites"}},
    {{"slcGCInvalidations"}, {"NumIntermediateMoves"}},
    {{"raidSuccessfulReconstructionInternal"}, {"SuccessfulReconstructionGC"}},
    {{"raidSuccessfulReconstructionHost"}, {"SuccessfulReconstructionNonGC"}},
    {{"raidFailedReconstructionInternal"}, {"FailedReconstructionGC"}},
    {{"raidFailedReconstructionHost"}, {"FailedReconstructionNonGC"}},
    {{"raidFailedLbaMismatch"}, {"InvalidParity"}},
    {{"bandsMaxTempHisto", 0, 21}, {"BandsMaxTempHisto", 0, 21}},
    {{"bandsMinTempHisto", 0, 21}, {"BandsMinTempHisto", 0, 21}},
    {{"bandsLifeTimeTempHisto", 0, 21}, {"BandsLifeTimeTempHisto", 0, 21}},
    {{"bandsDeltaTempHisto", 0, 21}, {"BandsDeltaTempHisto", 0, 21}},
    {{"bandsCrossTempHisto", 0, 44}, {"BandsCrossTempHisto", 0, 44}},
    {{"bitflipAddr0"}, {"BitFlipAddrE2E"}},
    {{"bitflipAddr1"}, {"BitFlipAddrCSW"}},
    {{"bitflipAddr2"}, {"BitFlipAddrECCMem"}},
    {{"bitflipAddr3"}, {"BitFlipAddrParityWidget"}},
    {{"bitflipAddr4"}, {"BitFlipAddrECCWidget"}},
    {{"bitflipCount0"}, {"BitFlipCountE2E"}},
    {{"bitflipCount1"}, {"BitFlipCountCSW"}},
    {{"bitflipCount2"}, {"BitFlipCountECCMem"}},
    {{"bitflipCount3"}, {"BitFlipCountParityWidget"}},
    {{"bitflipCount4"}, {"BitFlipCountECCWidget"}},
    {{"bitflipDupes0"}, {"BitFlipDupesE2E"}},
    {{"bitflipDupes1"}, {"BitFlipDupesCSW"}},
    {{"bitflipDupes2"}, {"BitFlipDupesECCMem"}},
    {{"bitflipDupes3"}, {"BitFlipDupesParityWidget"}},
    {{"bitflipDupes4"}, {"BitFlipDupesECCWidget"}},
    {{"E2EDPErrorCounters0"}, {"E2E_H2F_VL_LBA"}},
    {{"E2EDPErrorCounters1"}, {"E2E_H2F_VL_Corr"}},
    {{"E2EDPErrorCounters2"}, {"E2E_H2F_VL_UECC"}},
    {{"E2EDPErrorCounters3"}, {"E2E_H2F_SL_LBA"}},
    {{"E2EDPErrorCounters4"}, {"E2E_H2F_SL_Corr"}},
    {{"E2EDPErrorCounters5"}, {"E2E_H2F_SL_UECC"}},
    {{"E2EDPErrorCounters6"}, {"E2E_F2H_VL_LBA"}},
    {{"E2EDPErrorCounters7"}, {"E2E_F2H_VL_Corr"}},
    {{"E2EDPErrorCounters8"}, {"E2E_F2H_VL_UECC"}},
    {{"E2EDPErrorCounters9"}, {"E2E_F2H_SL_LBA"}},
    {{"E2EDPErrorCounters10"}, {"E2E_F2H_SL_Corr"}},
    {{"E2EDPErrorCounters11"}, {"E2E_F2H_SL_UECC"}},
    {{"wcacheDS_Reads"}, {"wcacheDSReads"}},
    {{"lhotSkipPrecent"}, {"lhotSkipPercent"}},
    {{"raidReconstructSuccessPartition0"}, {"raidReconstructSuccessPartition"}},
    {{"raidReconstructFailPartition0"}, {"raidReconstructFailPartition"}},
    {{"slcPercentUsed"}, {"IntermediatePartitionPEPercentUsed"}},
    {{"percentUsed"}, {"UserPartitionPEPercentUsed"}},
    {{"numFactoryBad"}, {"numFactoryBadBlocks"}},
    // clang-format on
});

constexpr auto kLegacyFields = []<std::size_t... Row>(std::index_sequence<Row...>) {
  return std::array{kRows[Row].fields...};
}
(std::make_index_sequence<kRows.size()>());
static_assert(std::ranges::all_of(kLegacyFields, [](const FieldRange& fields) {
  return fields.stem.size() + 9 < 100;
}));

}  // namespace

constinit const FieldTable keyMap = fieldTable<kLegacyFields>();

std::optional<std::string> legacyKeyOf(std::string_view field) {
  const FieldRange* fields = keyMap.find(field);
  if (fields == nullptr) {
    return std::nullopt;
  }
  const FieldRange& suffixes =
      kRows[static_cast<std::size_t>(fields - kLegacyFields.data())].suffixes;
  const std::uint32_t place = splitFieldName(field).number - fields->first;
  return std::string(NameText()
                         .append("com.quill.NANDInfo.")
                         .append(suffixes.stem)
                         .append(suffixes.first + place));
}

}  // namespace vesprun
