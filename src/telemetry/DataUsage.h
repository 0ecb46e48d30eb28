#pragma once

#include <chrono>
#include <cstdint>
#include <string_view>

namespace vesprun {

/// How long `CollectDataUsage` waits for the usage feed.
inline constexpr std::chrono::nanoseconds kUsageReplyTimeout{10'000'000'000};

/// Adds what each process has sent and received since the last run to today's scalars
/// "datausage.COUNTERKB.NAME", counts under "datausage.olddata.NAME" and "datausage.baddata.NAME"
/// the records that could not be used, and keeps the counters as the preference "netUsageBaseline"
/// of "com.quill.logsmith.vesprun" for the next run. A process whose name or date no document can
/// carry is left out of it. Returns when the counters are added and the baseline is set, or, with a
/// message, after `replyTimeout`; what is left is then done on the feed's thread, as long as the
/// platform lives. A reply that comes later still is lost, and the next run counts the growth.
///
/// Growth is counted once, also when the process is killed or a file cannot be written in between.
/// While the baseline cannot be written, or the counters cannot be read, nothing is counted.
///
/// The reply is handled on the feed's thread, with services that may be called from any thread.
///
/// A record without a name or a date is passed over; a counter that it lacks counts as 0.
void CollectDataUsage(std::chrono::nanoseconds replyTimeout = kUsageReplyTimeout);

}  // namespace vesprun
