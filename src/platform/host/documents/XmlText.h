#pragma once

#include <cstddef>
#include <string_view>

namespace vesprun {

/// Can an XML 1.0 document hold the code point?
constexpr bool isXmlCharacter(char32_t codePoint) {
  return codePoint >= 0x20 ? codePoint <= 0xD7FF || (codePoint >= 0xE000 && codePoint <= 0xFFFD) ||
                                 (codePoint >= 0x10000 && codePoint <= 0x10FFFF)
                           : codePoint == '\t' || codePoint == '\n' || codePoint == '\r';
}

/// The number of bytes, 1 to 4, of the UTF-8 character at the front; 0 when the text is empty or
/// begins with malformed UTF-8 or a character that XML excludes.
std::size_t xmlCharacterLength(std::string_view text);

/// The number of leading bytes that XML can carry.
std::size_t xmlTextLength(std::string_view text);

/// True when XML 1.0 can carry the whole text.
bool isXmlText(std::string_view text);

}  // namespace vesprun
