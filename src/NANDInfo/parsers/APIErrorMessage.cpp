#include "NANDInfo/parsers/APIErrorMessage.h"

#include <array>
#include <cstdarg>
#include <cstdio>
#include <new>
#include <optional>

namespace vesprun {
namespace {

std::optional<std::array<char, 1024>> GlobalAPIErrorMessage;

}  // namespace

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

void forgetAPIErrorMessage() { GlobalAPIErrorMessage.reset(); }

}  // namespace vesprun
