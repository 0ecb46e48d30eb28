#pragma once

#include <string>
#include <vector>

#include "common/Calendar.h"
#include "platform/host/counters/CounterStore.h"

namespace vesprun {

/// Reads the figures of the system below `root` (empty: the running one) and adds them to the
/// counters of the day of `now`: what grows by its growth since the last time, what goes up and
/// down as a value of a distribution. What was seen last is kept beside the counters and in the
/// same transaction: growth is never lost or counted twice, and of two at once the later goes on
/// from the earlier. Throws `SqliteFailure`.
///
/// Gives a line for everything that is left out, once in a boot and again when the reason changes.
std::vector<std::string> collectFigures(CounterStore& store, const std::string& root,
                                        const Date& now);

}  // namespace vesprun
