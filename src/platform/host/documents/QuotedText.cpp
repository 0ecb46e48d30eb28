#include "platform/host/documents/QuotedText.h"

#include <cstddef>

#include "platform/host/documents/XmlText.h"

namespace vesprun {

std::string quotedText(std::string_view text) {
  static constexpr std::string_view kHexDigits = "0123456789abcdef";
  constexpr std::size_t kMostCharacters = 40;
  std::string quoted = "\"";
  for (std::size_t count = 0; !text.empty(); ++count) {
    if (count == kMostCharacters) {
      quoted += "...";
      break;
    }
    const auto byte = static_cast<unsigned char>(text.front());
    const std::size_t length = byte < 0x20 || byte == 0x7F ? 0 : xmlCharacterLength(text);
    if (length == 0) {
      quoted += "\\x";
      quoted += kHexDigits[byte >> 4];
      quoted += kHexDigits[byte & 15];
      text.remove_prefix(1);
    } else {
      quoted += text.substr(0, length);
      text.remove_prefix(length);
    }
  }
  return quoted + '"';
}

}  // namespace vesprun
