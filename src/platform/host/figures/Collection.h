#pragma once

#include <optional>
#include <string>
#include <vector>

#include "common/Calendar.h"
#include "platform/host/counters/CounterStore.h"

namespace vesprun {

/// Reads the figures of the system below `root` (empty: the running one) and adds them to the
/// counters of the day of `now`: of counters their growth since the last time, of gauges one more
/// value of a distribution. What was seen last is kept in the same database and transaction: growth
/// is never lost or counted twice, and of two calls at once the later goes on from the earlier.
/// Throws `SqliteFailure`.
///
/// Gives a line for each file that is left out, once in a boot and again when the reason changes.
std::vector<std::string> collectFigures(CounterStore& store, const std::string& root,
                                        const Date& now);

/// When figures were last collected, as far as the database knows. Throws `SqliteFailure`.
std::optional<Date> lastCollection(CounterStore& store);

}  // namespace vesprun
