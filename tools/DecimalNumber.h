#pragma once

#include <CLI/CLI.hpp>
#include <concepts>
#include <limits>
#include <string>

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

}  // namespace vesprun
