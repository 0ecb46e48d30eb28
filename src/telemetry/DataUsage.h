#pragma once

#include <chrono>

namespace vesprun {

inline constexpr std::chrono::nanoseconds kUsageReplyTimeout{10'000'000'000};

/// Adds what each process sent and received since the last run to today's scalars
/// "datausage.COUNTERKB.NAME", counts unusable records as "datausage.olddata.NAME" and
/// "datausage.baddata.NAME", and keeps the counters as the preference "netUsageBaseline" of
/// "com.quill.logsmith.vesprun" (without processes whose name or date no document can carry).
///
/// Returns when that is done, or, with a message, after `replyTimeout`; the rest then runs on the
/// feed's thread as long as the platform lives. A reply that comes still later is lost, and the
/// next run counts the growth.
///
/// Growth is counted once, even if the process is killed or a file cannot be written. While the
/// baseline cannot be written, or the counters cannot be read, nothing is counted. A record without
/// a name or date is skipped; a missing counter is 0.
void CollectDataUsage(std::chrono::nanoseconds replyTimeout = kUsageReplyTimeout);

}  // namespace vesprun
