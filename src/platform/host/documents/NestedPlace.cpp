#include "platform/host/documents/NestedPlace.h"

#include "platform/host/documents/QuotedText.h"

namespace vesprun {

void NestedPlace::addOuter(std::string_view key) { _steps.push_back(quotedText(key)); }

void NestedPlace::addOuter(std::size_t index) {
  _steps.push_back('[' + std::to_string(index) + ']');
}

std::string NestedPlace::with(const std::string& message) const {
  constexpr std::size_t kMostSteps = 8;
  std::string text;
  for (std::size_t step = 0; step < _steps.size() && step < kMostSteps; ++step) {
    text += (step == 0 ? "" : " > ") + _steps[_steps.size() - 1 - step];
  }
  if (_steps.size() > kMostSteps) {
    text += " > \xE2\x80\xA6";
  }
  return text.empty() ? message : text + ": " + message;
}

}  // namespace vesprun
