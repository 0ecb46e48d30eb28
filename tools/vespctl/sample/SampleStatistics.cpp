#include "sample/SampleStatistics.h"

#include <map>
#include <string_view>
#include <vector>

#include "NANDInfo/parsers/ORUMSPKeyTable.h"
#include "NANDInfo/parsers/ORUStatKeyTable.h"
#include "NANDInfo/parsers/StatisticsBufferBuilder.h"
#include "common/LittleEndian.h"

namespace vesprun {
namespace {

using Figures = std::map<std::string_view, std::vector<std::uint64_t>>;

// A 128 GB device: 1792 bands of 72 MiB. Reads and writes are counted in sectors of 4096 bytes.
constexpr std::uint64_t kBands = 1792;
constexpr std::uint64_t kBlocksPerBand = 8;
constexpr std::uint64_t kBytesPerPage = 16384;
constexpr std::uint64_t kPagesPerBand = 4608;
constexpr std::uint64_t kPagesPerSlcBand = kPagesPerBand / 3;
constexpr std::uint64_t kSectorsPerPage = kBytesPerPage / 4096;
constexpr std::uint64_t kHoursInUse = 10'000;  // with power
constexpr std::uint64_t kHoursSinceFormat = 12'000;
constexpr std::uint64_t kSecondsPerHour = 3600;

/// A histogram of `count` bins that sum up to `total`, each holding about half of what is left.
std::vector<std::uint64_t> histogram(std::uint64_t total, std::size_t count) {
  std::vector<std::uint64_t> bins(count);
  for (std::size_t i = 0; i + 1 < count; ++i) {
    bins[i] = total - total / 2;
    total /= 2;
  }
  bins.back() = total;
  return bins;
}

Figures figuresAt(const Date& now, std::uint64_t hoursBack) {
  const std::uint64_t hours = kHoursInUse - hoursBack;
  const std::uint64_t hostWrites = 240'000 * hours;
  const std::uint64_t hostReads = 510'000 * hours;
  const std::uint64_t gcWrites = hostWrites * 11 / 10;
  const std::uint64_t nandWrites = hostWrites + gcWrites;
  const std::uint64_t bandErases = nandWrites / (kPagesPerBand * kSectorsPerPage);
  const std::uint64_t slcErases = hostWrites / (kPagesPerSlcBand * kSectorsPerPage);
  const std::uint64_t boots = hours / 50;
  const auto nowSeconds = static_cast<std::uint64_t>(now.seconds);
  const std::uint64_t takenAt = nowSeconds - hoursBack * kSecondsPerHour;
  return {
      {"exportVersion", {17}},
      {"bytesPerPage", {kBytesPerPage}},
      {"pagesPerVirtualBlock", {kPagesPerBand}},
      {"pagesPerVirtualBlockSlc", {kPagesPerSlcBand}},
      {"blocksPerVirtualBlock", {kBlocksPerBand}},
      {"numVirtualBlocks", {kBands}},
      {"numFreeVirtualBlocks", {143}},
      {"validLbas", {21'500'000}},
      {"staticSizeInMB", {52'400}},
      {"utilFormatTime", {nowSeconds - kHoursSinceFormat * kSecondsPerHour}},
      {"intermediatePartitionStart", {64}},
      {"userPartitionStart", {192}},
      {"nandDesc", {kSampleNandDescription}},
      {"nofDies", {4}},
      {"spareAvailablePercent", {100}},
      {"powerOnHours", {hours}},
      {"powerOnSeconds", {hours * kSecondsPerHour}},
      {"boots", {boots}},
      {"uncleanBoots", {boots / 25}},
      {"numSleepOps", {46 * hours}},
      {"numFlushes", {310 * hours}},
      {"hostReads", {hostReads}},
      {"hostReadXacts", {hostReads / 9}},
      {"hostReadLogHisto", histogram(hostReads / 9, 10)},
      {"hostWrites", {hostWrites}},
      {"hostWriteXacts", {hostWrites / 11}},
      {"hostWriteLogHisto", histogram(hostWrites / 11, 10)},
      {"hostWritesDyn", {hostWrites - hostWrites / 4}},
      {"hostWritesStatic", {hostWrites / 4}},
      {"hostWritesMeta", {hostWrites / 30}},
      {"gcWrites", {gcWrites}},
      {"nandReads", {hostReads + gcWrites}},
      {"nandWrites", {nandWrites}},
      {"wearLevMoves", {bandErases / 180}},
      {"bandErases", {bandErases}},
      {"intermediateBandErases", {slcErases}},
      {"averageTLCPECycles", {bandErases / kBands}},
      {"averageSLCPECycles", {slcErases / 128}},
      {"percentUsed", {bandErases / kBands * 100 / 3000}},
      {"slcPercentUsed", {slcErases / 128 * 100 / 60'000}},
      {"maxHighEnduranceBlockErases", {slcErases / 100}},
      {"IND_pool_free", {30'210}},
      {"IND_pool_count", {65'536}},
      {"readCountHisto", histogram(kBands, 5)},
      {"bandsMaxTempHisto", histogram(kBands, 22)},
      {"bandsMinTempHisto", histogram(kBands, 22)},
      {"vcurve", histogram(kBands, 32)},
      {"maxMemChokeDuration", {1874}},
      {"numBootBlockRefreshSuccess", {3, 2, 0, 0, 0, 0, 0, 0}},
      {"mspBootBlockCountPerMsp", {4}},
      {"numFactoryBad", {12}},
      {"magazineFWVersion", {0x3130'3937, 0x2E31'2E34, 0x0031}},
      {"magazineInstanceMeta", {(takenAt & 0xFFFF'FFFF) << 24}},
  };
}

/// Words, little-endian.
class Words {
 public:
  Words& add(std::uint32_t word) {
    appendLittleEndian(bytes, word, sizeof word);
    return *this;
  }

  Bytes bytes;
};

}  // namespace

Bytes sampleStatistics(const Date& now, std::uint64_t hoursBack) {
  const Figures figures = figuresAt(now, hoursBack);
  StatisticsBufferBuilder buffer;
  for (const ORUStatKey& key : ORUStatKeyTable) {
    const auto found = figures.find(key.name);
    std::vector<std::uint64_t> values =
        found != figures.end() ? found->second : std::vector<std::uint64_t>{};
    values.resize(key.count);
    buffer.add(key.id, values);
  }
  return buffer.bytes();
}

Bytes sampleMSPStatistics(std::uint32_t index) {
  const std::uint64_t reads = 1'300'000'000 + 20'000'000ULL * index;
  const Figures figures{
      {"passWithTmodeHard", {reads}},
      {"readAlgoPassWithHardAfterAcq", {reads / 4000}},
      {"FS1decodedbitflips", histogram(reads / 20'000, 11)},
      {"readErasedPage", {reads / 60'000}},
      {"fw_version_identifier", {0x0001'0004'0009'0017}},
  };
  MSPBufferBuilder buffer;
  for (const ORUMSPKey& key : ORUMSPKeyTable) {
    const auto found = figures.find(key.name);
    std::vector<std::uint64_t> values =
        found != figures.end() ? found->second : std::vector<std::uint64_t>{};
    values.resize(key.count);
    buffer.add(key.key, values);
  }
  return buffer.bytes();
}

Bytes sampleTelemetry(std::uint32_t kind) {
  constexpr std::uint32_t kWordsPerBlock = 1024;
  Words list;
  for (std::uint32_t bus = 0; bus < kSampleBuses; ++bus) {
    for (std::uint32_t word = 0; word < kWordsPerBlock; ++word) {
      list.add((4'000'000U >> (word % 24)) + bus * 10 + kind);
    }
  }
  constexpr std::uint32_t kReadDisturbs = 41'000;
  constexpr std::uint32_t kCycles = 152;
  for (std::uint32_t bus = 0; bus < kSampleBuses; ++bus) {
    list.add(kReadDisturbs + bus).add(kCycles).add(3).add(24).add(90).add(kind);
    list.add(kPagesPerBand / kBlocksPerBand).add(0);
  }
  return list.bytes;
}

Bytes sampleValidity() {
  constexpr std::uint32_t kLists = 4;
  constexpr std::uint32_t kEntriesPerList = 16;
  Words list;
  list.add(kLists * kEntriesPerList).add(1).add(0).add(0);
  for (std::uint32_t entry = 0; entry < kLists * kEntriesPerList; ++entry) {
    const std::uint32_t percent = 100 - entry * 100 / (kLists * kEntriesPerList);
    list.add(entry).add(entry % kLists).add(percent).add(0).add(0);
  }
  return list.bytes;
}

Bytes sampleDefects() {
  constexpr std::uint32_t kDefectCount = 12;
  Words list;
  list.add(1).add(kDefectCount).add(kDefectCount);
  for (std::uint32_t defect = 0; defect < kDefectCount; ++defect) {
    const std::uint32_t bus = defect % kSampleBuses;
    const std::uint32_t chipEnable = defect % 2;
    const std::uint32_t mode = defect % 3;
    list.add(chipEnable << 16 | bus).add(defect % 2).add(37 + 113 * defect).add(0);
    list.add(5).add(0).add(30).add(mode);
  }
  return list.bytes;
}

}  // namespace vesprun
