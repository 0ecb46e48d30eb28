#include "NANDInfo/sets/VMFreezerInfo.h"

#include <cstddef>
#include <optional>
#include <span>

#include "NANDInfo/parsers/KernelSnapshot.h"
#include "common/LittleEndian.h"
#include "platform/Platform.h"

namespace vesprun {
namespace {

constexpr std::uint32_t kCaptureFlags = 0x10000;
constexpr const char* kSwapOutThread = "VM_swapout";

// The fourth of the counters, each of 8 bytes.
constexpr std::size_t kBytesWrittenOffset = 24;

}  // namespace

PropertyDict gatherVMFreezerInfo() {
  const std::optional<Bytes> snapshot = platform().kernel().captureSnapshot(kCaptureFlags);
  std::optional<std::span<const std::uint8_t>> ioStatistics;
  if (!snapshot || !getIOStatsWithThreadnameFromSnapDataHelper(*snapshot, kSwapOutThread,
                                                               ioStatistics, nullptr)) {
    return {};
  }
  std::uint64_t bytesWritten = 0;
  if (ioStatistics && ioStatistics->size() >= kBytesWrittenOffset + sizeof(bytesWritten)) {
    bytesWritten = loadLittleEndian<std::uint64_t>(ioStatistics->data() + kBytesWrittenOffset);
  }
  return {{"HLT_VMFreezer_bytesWritten", bytesWritten},
          {"com.quill.NANDInfo.VMFreezer.NumPhysicalWrites", bytesWritten}};
}

}  // namespace vesprun
