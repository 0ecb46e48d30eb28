#pragma once

#include <CLI/CLI.hpp>
#include <concepts>
#include <cstdint>
#include <limits>
#include <optional>
#include <string>
#include <string_view>

#include "platform/host/documents/NumberText.h"
#include "platform/host/documents/QuotedText.h"

namespace vesprun {

/// For `transform`: accepts only a decimal integer that fits `T`, with leading zeros, and a sign if
/// `T` has one. CLI11 itself would take `010` for eight.
template <std::integral T>
CLI::Validator decimal() {
  return CLI::Validator(
      [](std::string& text) {
        T number = 0;
        if (!parseWholeText(text, number)) {
          return quotedText(text) + " is not a number from " +
                 std::to_string(std::numeric_limits<T>::min()) + " to " +
                 std::to_string(std::numeric_limits<T>::max());
        }
        text = std::to_string(number);
        return std::string();
      },
      "");
}

/// A day as the command line gives it: a number of days since 1970, YYYY-MM-DD, today or yesterday.
class GivenDay {
 public:
  /// Nothing for any other text.
  static std::optional<GivenDay> parse(std::string_view text);

  /// The day, where `today` is that of the device, or of the machine.
  std::int32_t on(std::int32_t today) const;

 private:
  std::int64_t _day = 0;  ///< back from today when that is so
  bool _isBack = false;
};

inline constexpr const char* kNoDay =
    " is not a day: a number of days since 1970, YYYY-MM-DD, today or yesterday";

/// Adds an option, or a positional argument, that is a day.
CLI::Option* addDay(CLI::App& command, const std::string& name, std::optional<GivenDay>& day,
                    const std::string& help);

/// The days from one to another, both included; without these, from the first or to the last.
struct GivenDays {
  std::optional<GivenDay> from;
  std::optional<GivenDay> to;

  std::int32_t first(std::int32_t today) const {
    return from ? from->on(today) : std::numeric_limits<std::int32_t>::min();
  }
  std::int32_t last(std::int32_t today) const {
    return to ? to->on(today) : std::numeric_limits<std::int32_t>::max();
  }
};

/// Adds --from and --to.
void addDays(CLI::App& command, GivenDays& days);

/// "2024-03-05"
std::string dateOfDay(std::int32_t day);

}  // namespace vesprun
