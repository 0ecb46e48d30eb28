#include "platform/Platform.h"
#include "report/TBReport.h"

namespace vesprun {
namespace {

std::int64_t minutesAwake() {
  Kernel& kernel = platform().kernel();
  const std::uint64_t ticks = kernel.monotonicTicks();
  const std::optional<TickRatio> ratio = kernel.tickRatio();
  if (!ratio || ratio->denominator == 0) {
    logMessage(LogLevel::Error, "Couldn't retrieve mach_timebase_info");
    return -1;
  }
  // The order of the operations decides the last bit.
  return saturatingTruncate(static_cast<double>(ratio->numerator) * 1e-9 /
                            static_cast<double>(ratio->denominator) / 60 *
                            static_cast<double>(ticks));
}

}  // namespace

void TBReport::reportCPUUptime() {
  addScalarForKeyByExecutingBlock("com.quill.usage.cur_boot_session_cpu_uptime", minutesAwake);
}

}  // namespace vesprun
