#include "platform/host/documents/XmlText.h"

#include <cstdint>
#include <cstring>

namespace vesprun {

std::size_t xmlCharacterLength(std::string_view text) {
  if (text.empty()) {
    return 0;
  }
  const auto byteAt = [&text](std::size_t at) { return static_cast<std::uint8_t>(text[at]); };
  const std::uint8_t lead = byteAt(0);
  if (lead < 0x80) {
    return isXmlCharacter(lead) ? 1 : 0;
  }
  const std::size_t length = lead >= 0xF0 ? 4 : lead >= 0xE0 ? 3 : 2;
  // C0 and C1 begin only overlong forms, F5 and above lie beyond Unicode.
  if (lead < 0xC2 || lead > 0xF4 || text.size() < length) {
    return 0;
  }
  char32_t codePoint = lead & (0xFFU >> (length + 1));
  for (std::size_t at = 1; at < length; ++at) {
    if ((byteAt(at) & 0xC0) != 0x80) {
      return 0;
    }
    codePoint = codePoint << 6 | (byteAt(at) & 0x3FU);
  }
  const bool overlong = (length == 3 && codePoint < 0x800) || (length == 4 && codePoint < 0x10000);
  return !overlong && isXmlCharacter(codePoint) ? length : 0;
}

std::size_t xmlTextLength(std::string_view text) {
  std::size_t at = 0;
  while (at < text.size()) {
    // Eight bytes at a time as long as all are printable ASCII characters.
    constexpr std::uint64_t kOnes = 0x0101010101010101;
    std::uint64_t bytes = 0;
    if (text.size() - at >= sizeof bytes) {
      std::memcpy(&bytes, text.data() + at, sizeof bytes);
      if (((bytes | (bytes - kOnes * ' ')) & kOnes * 0x80) == 0) {
        at += sizeof bytes;
        continue;
      }
    }
    const auto byte = static_cast<std::uint8_t>(text[at]);
    const std::size_t length =
        byte >= 0x20 && byte < 0x80 ? 1 : xmlCharacterLength(text.substr(at));
    if (length == 0) {
      break;
    }
    at += length;
  }
  return at;
}

bool isXmlText(std::string_view text) { return xmlTextLength(text) == text.size(); }

}  // namespace vesprun
