#pragma once

#include <cstdint>
#include <functional>
#include <istream>
#include <optional>
#include <set>
#include <string>
#include <string_view>

#include "platform/host/counters/CounterStore.h"

namespace vesprun {

// Counters as lines of text with fields separated by tabs:
//
//   scalar DAY KEY VALUE
//   sample DAY KEY VALUE OFFSET
//
// DAY and OFFSET are signed 32-bit integers, a scalar's VALUE is a signed 64-bit one, a sample's a
// decimal number, "inf", "-inf" or "nan". A key may hold tabs but no line feed.

/// Called for each line.
using LineStep = std::function<void(std::string_view line)>;

/// Reads lines without taking them. Gives the days that they name; nothing, with "line N: ..." in
/// `error`, at the first bad line.
std::optional<std::set<std::int32_t>> checkCounterLines(std::istream& lines, std::string& error,
                                                        const LineStep& step);

/// Sets scalars and appends samples, in order for each key. Lines are streamed. False, with "line
/// N: ..." in `error`, at the first bad line. May throw `SqliteFailure`.
bool importCounterLines(std::istream& lines, CounterStore& counters, std::string& error,
                        const LineStep& step = {});

/// Writes the counters of `firstDay` to `lastDay`, both included: by day, scalars before samples,
/// by key; samples in stored order, in the shortest text that reads back. `sink` takes pieces of
/// text, and ends the export with false.
///
/// False, with a text in `error`, when keys with line feeds were left out. May throw
/// `SqliteFailure`.
bool exportCounterLines(CounterStore& counters, std::int32_t firstDay, std::int32_t lastDay,
                        const std::function<bool(std::string_view)>& sink, std::string& error);

}  // namespace vesprun
