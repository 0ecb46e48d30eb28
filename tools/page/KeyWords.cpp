#include "page/KeyWords.h"

#include <algorithm>
#include <iterator>

#include "platform/host/figures/FigureTable.h"

namespace vesprun {
namespace {

/// Fields of the storage that a daily log may have; the others speak for themselves as far as they
/// do.
constexpr struct {
  std::string_view field, words;
} kStorageFields[] = {
    {"numGrownBad", "blocks that went bad in use"},
    {"numPfail", "program operations that failed"},
    {"numEfail", "erase operations that failed"},
    {"numDieFailures", "dies that failed"},
    {"raidFailedReconstructionHost", "data that could not be reconstructed for the system"},
    {"raidFailedReconstructionInternal", "data that could not be reconstructed when moved"},
    {"numFactoryBad", "blocks that were bad from the factory"},
    {"percentUsed", "rated erase cycles that are used"},
    {"UserPartitionPEPercentUsed", "rated erase cycles of the user partition that are used"},
    {"IntermediatePartitionPEPercentUsed",
     "rated erase cycles of the intermediate partition that are used"},
    {"spareAvailablePercent", "spare blocks that are left"},
    {"hostWrites", "what the system has written"},
    {"hostReads", "what the system has read"},
    {"nandWrites", "what was written to the flash"},
    {"UncleanBoots", "starts after an unclean shutdown"},
    {"uncleanBoots", "starts after an unclean shutdown"},
    {"powerOnHours", "hours that the storage was powered"},
    {"PowerOnHours", "hours that the storage was powered"},
    {"UserWamp", "write amplification of the user partition"},
    {"HLT_OR_Diskfullness_BP", "how full the storage is"},
    {"HLT_averageTLCPECycles", "erases of a TLC block on average"},
    {"HLT_averageSLCPECycles", "erases of an SLC block on average"},
};

}  // namespace

KeyWords wordsOf(std::string_view key) {
  for (const LinuxFigure& figure : linuxFigures) {
    if (key == figure.key || (figure.key.ends_with('.') && key.starts_with(figure.key))) {
      return {std::string(figure.why), unitNamed(figure.unit), false};
    }
  }
  constexpr std::string_view kStorage = "com.quill.NANDInfo.";
  KeyWords words{"", unitOfKey(key), false};
  if (key.starts_with(kStorage)) {
    const std::string_view field = key.substr(kStorage.size());
    const auto found =
        std::ranges::find_if(kStorageFields, [=](const auto& row) { return row.field == field; });
    words.words = found != std::end(kStorageFields) ? found->words : "a figure of the storage";
    words.isRunningTotal = words.unit != Unit::Percent;
  }
  return words;
}

}  // namespace vesprun
