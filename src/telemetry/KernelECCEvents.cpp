#include "telemetry/KernelECCEvents.h"

#include <algorithm>
#include <array>
#include <cstdint>
#include <span>
#include <string>

#include "common/LittleEndian.h"
#include "platform/DictionaryHelpers.h"
#include "platform/Platform.h"

namespace vesprun {
namespace {

constexpr const char* kNextEvent = "kern.next_ecc_event";
constexpr std::int32_t kECCEventRecordType = 172;
constexpr int kMaxEventsPerRun = 10;

constexpr int kNoSuchEntry = 2;
constexpr int kBusy = 16;

constexpr std::size_t kMaxRegisters = 8;
constexpr std::size_t kFirstRegister = 8;  ///< offset in the record
using ECCEventRecord = std::array<std::uint8_t, kFirstRegister + kMaxRegisters * 8>;
static_assert(sizeof(ECCEventRecord) == 72);

PropertyDict describe(const ECCEventRecord& event) {
  const std::uint8_t count = event[1];
  PropertyDict record{{"id", event[0]}, {"count", count}};
  for (std::size_t i = 0; i < std::min<std::size_t>(count, kMaxRegisters); ++i) {
    setNumberValueForType(record, "reg" + std::to_string(i),
                          static_cast<std::int64_t>(loadLittleEndian<std::uint64_t>(
                              event.data() + kFirstRegister + i * sizeof(std::uint64_t))));
  }
  return record;
}

}  // namespace

void LogKernelECCEvents() {
  Kernel& kernel = platform().kernel();
  ECCEventRecord event{};
  std::size_t length = event.size();  // not reset between reads
  const auto readNext = [&] {
    return kernel.sysctlbyname(kNextEvent, std::span(event).first(length), length);
  };
  int systemError = readNext();
  for (int logged = 0; systemError == 0 && logged < kMaxEventsPerRun; ++logged) {
    // Not acknowledged without a record: the event waits for the next run.
    if (!platform().logsmith().FLLogStructuredData(kECCEventRecordType, describe(event)) ||
        !kernel.acknowledgeECCEvent()) {
      return;
    }
    systemError = readNext();
  }
  if (systemError == 0) {
    kernel.acknowledgeECCEvent();  // the one beyond the limit
  }
  if (systemError != kNoSuchEntry && systemError != kBusy) {
    logMessage(LogLevel::Default, "Unexpected errno (%d) reading ECC events from kernel",
               systemError);
  }
}

}  // namespace vesprun
