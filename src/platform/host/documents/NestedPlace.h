#pragma once

#include <cstddef>
#include <string>
#include <string_view>
#include <vector>

#include "platform/host/documents/QuotedText.h"

namespace vesprun {

/// How deep dictionaries and arrays may nest, in ptree documents and in JSON.
inline constexpr std::size_t kMaxNestedLevels = 200;
inline constexpr const char* kNestedTooDeeply = "nested deeper than 200 levels";

/// The path to a place in a value, collected from the inside out as a recursive walk returns.
class NestedPlace {
 public:
  void addOuter(std::string_view key) { _steps.push_back(quotedText(key)); }
  void addOuter(std::size_t index) { _steps.push_back('[' + std::to_string(index) + ']'); }

  /// "STEP > STEP: MESSAGE" with the 8 outermost steps.
  std::string with(const std::string& message) const {
    constexpr std::size_t kMaxSteps = 8;
    std::string text;
    for (std::size_t step = 0; step < _steps.size() && step < kMaxSteps; ++step) {
      text += (step == 0 ? "" : " > ") + _steps[_steps.size() - 1 - step];
    }
    if (_steps.size() > kMaxSteps) {
      text += " > \xE2\x80\xA6";
    }
    return text.empty() ? message : text + ": " + message;
  }

 private:
  std::vector<std::string> _steps;
};

}  // namespace vesprun
