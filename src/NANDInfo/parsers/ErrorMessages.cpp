#include "NANDInfo/parsers/ErrorMessages.h"

#include <array>
#include <cstdarg>
#include <cstdio>
#include <new>
#include <optional>

#include "common/ProcessState.h"

namespace vesprun {
namespace {

std::optional<std::array<char, 1024>> GlobalAPIErrorMessage;
const ProcessState kErrorMessageState(ForgetAPIErrorMessage);

}  // namespace

void ForgetAPIErrorMessage() noexcept { GlobalAPIErrorMessage.reset(); }

void SetAPIErrorMessage(const char* format, ...) noexcept {
  if (GlobalAPIErrorMessage) {
    return;
  }
  auto& text = GlobalAPIErrorMessage.emplace();
  std::va_list arguments;
  va_start(arguments, format);
  std::vsnprintf(text.data(), text.size(), format, arguments);
  va_end(arguments);
}

std::string GetAPIErrorMessage() noexcept {
  try {
    return GlobalAPIErrorMessage ? GlobalAPIErrorMessage->data() : "NA";
  } catch (const std::bad_alloc&) {
    return {};
  }
}

}  // namespace vesprun
