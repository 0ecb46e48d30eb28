#include "platform/host/documents/QuotedText.h"

#include <algorithm>
#include <cstddef>
#include <limits>

#include "common/HexText.h"
#include "platform/host/documents/XmlText.h"

namespace vesprun {
namespace {

void appendPrintable(std::string_view text, std::size_t mostCharacters, std::string& printable) {
  for (std::size_t count = 0; !text.empty(); ++count) {
    if (count == mostCharacters) {
      printable += "...";
      return;
    }
    const auto byte = static_cast<unsigned char>(text.front());
    const std::size_t length = xmlCharacterLength(text);
    const bool control =
        byte < 0x20 || byte == 0x7F ||
        (length == 2 && byte == 0xC2 && static_cast<unsigned char>(text[1]) < 0xA0);
    if (length == 0 || control) {
      printable += "\\x";
      appendHex(printable, byte);
      text.remove_prefix(1);
    } else {
      printable += text.substr(0, length);
      text.remove_prefix(length);
    }
  }
}

}  // namespace

std::string printableText(std::string_view text) {
  const auto isPlain = [](char c) { return c >= ' ' && c < 0x7F; };
  if (std::ranges::all_of(text, isPlain)) {
    return std::string(text);
  }
  std::string printable;
  appendPrintable(text, std::numeric_limits<std::size_t>::max(), printable);
  return printable;
}

std::string quotedText(std::string_view text) {
  std::string quoted = "\"";
  appendPrintable(text, 40, quoted);
  return quoted + '"';
}

}  // namespace vesprun
