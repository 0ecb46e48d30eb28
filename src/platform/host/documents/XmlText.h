#pragma once

#include <cstddef>
#include <string_view>

namespace vesprun {

/// True for a code point that an XML 1.0 document can hold: tab, line feed, carriage return and
/// U+0020 upwards, but no surrogate, U+FFFE or U+FFFF.
constexpr bool isXmlCharacter(char32_t codePoint) {
  return codePoint >= 0x20 ? codePoint <= 0xD7FF || (codePoint >= 0xE000 && codePoint <= 0xFFFD) ||
                                 (codePoint >= 0x10000 && codePoint <= 0x10FFFF)
                           : codePoint == '\t' || codePoint == '\n' || codePoint == '\r';
}

/// The number of bytes, 1 to 4, of the UTF-8 character that `text` begins with. 0 when the text is
/// empty or begins with something else: malformed or overlong UTF-8, or no XML character.
std::size_t xmlCharacterLength(std::string_view text);

/// The number of bytes before the first one that XML cannot carry; the whole size when there is
/// none.
std::size_t xmlTextLength(std::string_view text);

/// True when the text is UTF-8 and every character of it can stand in an XML 1.0 document.
bool isXmlText(std::string_view text);

}  // namespace vesprun
