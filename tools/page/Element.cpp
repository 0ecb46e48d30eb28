#include "page/Element.h"

#include <algorithm>
#include <array>
#include <cstdio>
#include <iterator>

#include "page/Quantity.h"
#include "platform/host/documents/XmlText.h"

namespace vesprun {
namespace {

constexpr std::size_t kMaxName = 120;  // bytes
constexpr std::size_t kShownHead = 80;
constexpr std::size_t kShownTail = 30;

/// Characters without a look of their own: controls, and those that Unicode calls default-ignorable
/// or separators of lines, among them all that reorder text.
bool isUnseen(char32_t character) {
  static constexpr struct {
    char32_t first, last;
  } kRanges[] = {{0, 0x1F},          {0x7F, 0x9F},       {0xAD, 0xAD},      {0x34F, 0x34F},
                 {0x61C, 0x61C},     {0x115F, 0x1160},   {0x17B4, 0x17B5},  {0x180B, 0x180F},
                 {0x200B, 0x200F},   {0x2028, 0x202E},   {0x2060, 0x206F},  {0x3164, 0x3164},
                 {0xFE00, 0xFE0F},   {0xFEFF, 0xFEFF},   {0xFFA0, 0xFFA0},  {0xFFF0, 0xFFFB},
                 {0x1BCA0, 0x1BCA3}, {0x1D173, 0x1D17A}, {0xE0000, 0xE0FFF}};
  return std::any_of(std::begin(kRanges), std::end(kRanges), [character](const auto& range) {
    return character >= range.first && character <= range.last;
  });
}

char32_t decoded(std::string_view character) {
  const auto lead = static_cast<unsigned char>(character.front());
  char32_t value = character.size() == 1 ? lead : lead & (0x7FU >> character.size());
  for (const char byte : character.substr(1)) {
    value = value << 6 | (static_cast<unsigned char>(byte) & 0x3FU);
  }
  return value;
}

void appendEscaped(char byte, std::string& html) {
  switch (byte) {
    case '&':
      html += "&amp;";
      break;
    case '<':
      html += "&lt;";
      break;
    case '>':
      html += "&gt;";
      break;
    case '"':
      html += "&quot;";
      break;
    case '\'':
      html += "&#39;";
      break;
    default:
      html += byte;
  }
}

/// A byte that is not UTF-8 becomes "\xnn", an unseen character "\u{N}".
void appendText(std::string_view text, std::string& html) {
  char escape[16];
  while (!text.empty()) {
    const auto first = static_cast<unsigned char>(text.front());
    if (first >= ' ' && first < 0x7F) {
      appendEscaped(text.front(), html);
      text.remove_prefix(1);
      continue;
    }
    const std::size_t length = xmlCharacterLength(text);
    const std::string_view character = text.substr(0, length == 0 ? 1 : length);
    const char32_t value = decoded(character);
    const bool isByte = length == 0 && value > 0x7F;
    if (isByte || isUnseen(value)) {
      std::snprintf(escape, sizeof escape, isByte ? "\\x%02x" : "\\u{%X}",
                    static_cast<unsigned>(value));
      html += escape;
    } else {
      html += character;
    }
    text.remove_prefix(character.size());
  }
}

void appendAttribute(const Attribute& attribute, std::string& html) {
  html += ' ';
  html += attribute.name.text();
  if (attribute.value.empty()) {
    return;
  }
  const bool isPlain = std::ranges::all_of(attribute.value, [](char c) {
    return (c >= 'a' && c <= 'z') || (c >= 'A' && c <= 'Z') || (c >= '0' && c <= '9') || c == '-' ||
           c == '#';
  });
  html += isPlain ? "=" : "=\"";
  appendText(attribute.value, html);
  html += isPlain ? "" : "\"";
}

/// Whether an element of that tag needs no end, because HTML has none or the next element ends it.
bool endsByItself(std::string_view tag) {
  static constexpr std::string_view kTags[] = {"meta", "input", "br", "tr", "td", "th", "li"};
  return std::ranges::find(kTags, tag) != std::end(kTags);
}

/// Drawn shapes without content.
bool isShape(std::string_view tag) {
  return tag == "path" || tag == "use" || tag == "rect" || tag == "col";
}

/// Moves a place in the text to the beginning of the character that it lies in.
std::size_t characterStart(std::string_view text, std::size_t place) {
  constexpr std::size_t kMaxCharacter = 4;
  for (std::size_t back = 0; back < kMaxCharacter && back <= place; ++back) {
    const std::size_t length = xmlCharacterLength(text.substr(place - back));
    if (length > back) {
      return place - back;
    }
  }
  return place;
}

}  // namespace

Element Element::embedded(ConstantText tag, ConstantText content) {
  Element element(tag, {});
  element._embedded = content.text();
  return element;
}

Element Element::constant(ConstantText text) {
  Element element;
  element._embedded = text.text();
  return element;
}

void Element::writeTo(std::string& html) const {
  if (_tag != nullptr) {
    html += '<';
    html += _tag;
    for (const Attribute& attribute : _attributes) {
      appendAttribute(attribute, html);
    }
    // Right after an unquoted value the slash would belong to it.
    html += isShape(_tag) ? " />" : ">";
  }
  if (_embedded != nullptr) {
    html += _embedded;
  }
  appendText(_text, html);
  for (const Element& child : _children) {
    child.writeTo(html);
  }
  if (_tag != nullptr && !endsByItself(_tag) && !isShape(_tag)) {
    html += "</";
    html += _tag;
    html += '>';
  }
}

bool isLongName(std::string_view name) { return name.size() > kMaxName; }

Element nameElement(std::string_view name) {
  if (name.empty()) {
    return {"i", {}, "empty"};
  }
  if (!isLongName(name)) {
    return {"bdi", {}, name};
  }
  const std::string_view head = name.substr(0, characterStart(name, kShownHead));
  const std::string_view tail = name.substr(characterStart(name, name.size() - kShownTail));
  return std::vector<Element>{Element("bdi", {}, head),
                              Element("small", {}, " … " + numeral(name.size()) + " bytes … "),
                              Element("bdi", {}, tail)};
}

std::string cutInTheMiddle(std::string_view text, std::size_t longest) {
  if (text.size() <= longest) {
    return std::string(text);
  }
  const std::size_t half = longest / 2;
  return std::string(text.substr(0, characterStart(text, half))) + "…" +
         std::string(text.substr(characterStart(text, text.size() - half)));
}

Element folded(Element summary, Element content, bool isOpen) {
  return {"details", isOpen ? Attributes{{"open"}} : Attributes{},
          Element("summary", {}, std::move(summary)), std::move(content)};
}

}  // namespace vesprun
