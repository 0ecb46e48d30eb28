#pragma once

#include <CLI/CLI.hpp>
#include <charconv>
#include <concepts>
#include <limits>
#include <string>
#include <system_error>

#include "platform/host/documents/QuotedText.h"

namespace vesprun {

/// For `transform`: accepts only a decimal integer that fits `T`, with leading zeros, and a sign if
/// `T` has one. CLI11 itself would take `010` for eight.
template <std::integral T>
CLI::Validator decimal() {
  return CLI::Validator(
      [](std::string& text) {
        T number = 0;
        const char* const end = text.data() + text.size();
        const auto [rest, error] = std::from_chars(text.data(), end, number);
        if (error != std::errc() || rest != end) {
          return quotedText(text) + " is not a number from " +
                 std::to_string(std::numeric_limits<T>::min()) + " to " +
                 std::to_string(std::numeric_limits<T>::max());
        }
        text = std::to_string(number);
        return std::string();
      },
      "");
}

}  // namespace vesprun
