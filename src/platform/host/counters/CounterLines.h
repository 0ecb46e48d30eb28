#pragma once

#include <charconv>
#include <cstdint>
#include <functional>
#include <istream>
#include <optional>
#include <string>
#include <string_view>
#include <system_error>

#include "platform/host/counters/CounterStore.h"
#include "platform/host/documents/RealText.h"

namespace vesprun {

// Counters as lines of text, their fields parted by tabs:
//
//   scalar DAY KEY VALUE
//   sample DAY KEY VALUE OFFSET
//
// DAY and OFFSET are signed 32-bit integers, the VALUE of a scalar a signed 64-bit one. That of a
// sample is a decimal floating-point number, "inf", "-inf" or "nan". A key may hold tabs, but no
// line feed.

/// Reads a number that takes the whole text. False when it is none or out of range.
template <typename T>
bool parseWholeText(std::string_view text, T& value) {
  const auto [end, failure] = std::from_chars(text.data(), text.data() + text.size(), value);
  return failure == std::errc() && end == text.data() + text.size();
}

/// The same for the forms that a sample may have.
inline bool parseWholeText(std::string_view text, double& value) {
  const std::optional<double> real = parseReal(text);
  value = real.value_or(value);
  return real.has_value();
}

/// Sets scalars and appends samples, which keep their order for each key. The lines are read as a
/// stream and never held as a whole. False, with "line N: ..." and the cause in `error`, at the
/// first bad line. May throw `SqliteFailure`.
bool importCounterLines(std::istream& lines, CounterStore& counters, std::string& error);

/// Writes the counters of `firstDay` to `lastDay`, both included: by day, scalars before samples,
/// by key; samples in their stored order and in the shortest text that reads back to the same
/// value. `sink` takes text in pieces; when it says false, the export ends.
///
/// False, with a text in `error`, when rows were left out since their keys hold a line feed. May
/// throw `SqliteFailure`.
bool exportCounterLines(CounterStore& counters, std::int32_t firstDay, std::int32_t lastDay,
                        const std::function<bool(std::string_view)>& sink, std::string& error);

}  // namespace vesprun
