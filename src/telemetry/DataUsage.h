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
/// of "com.quill.logsmith.vesprun" for the next run. Returns when the feed's reply has been
/// handled, or, with a message, after `replyTimeout`. A reply that comes later is handled all the
/// same, as long as the platform lives; one that comes later still is lost, and the next run counts
/// the growth from the baseline of the run before.
///
/// The reply is handled on the feed's thread. It shares nothing with the caller but the counter
/// database and the preferences, which may be called from any thread.
///
/// A record without a name or a date is passed over; a counter that it lacks counts as 0.
void CollectDataUsage(std::chrono::nanoseconds replyTimeout = kUsageReplyTimeout);

}  // namespace vesprun
