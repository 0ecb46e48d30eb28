#include "page/Html.h"

#include <algorithm>
#include <cmath>
#include <cstdio>
#include <iterator>

#include "common/Calendar.h"
#include "common/TextForm.h"
#include "platform/host/documents/XmlText.h"

namespace vesprun {
namespace {

constexpr std::size_t kLongestName = 120;  // bytes
constexpr std::size_t kShownHead = 80;
constexpr std::size_t kShownTail = 30;

constexpr const char* kNarrowSpace = "\u202F";

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

void appendEscaped(std::string_view character, std::string& html) {
  static constexpr struct {
    char character;
    std::string_view html;
  } kEscapes[] = {{'&', "&amp;"}, {'<', "&lt;"}, {'>', "&gt;"}, {'"', "&quot;"}, {'\'', "&#39;"}};
  for (const auto& escape : kEscapes) {
    if (escape.character == character.front()) {
      character = escape.html;
    }
  }
  html += character;
}

/// Moves a place in the text to the beginning of the character that it lies in.
std::size_t characterStart(std::string_view text, std::size_t place) {
  constexpr std::size_t kLongestCharacter = 4;
  for (std::size_t back = 0; back < kLongestCharacter && back <= place; ++back) {
    const std::size_t length = xmlCharacterLength(text.substr(place - back));
    if (length > back) {
      return place - back;
    }
  }
  return place;
}

/// Digits, with what may stand before and after them, in groups of three.
std::string grouped(std::string text) {
  const std::size_t start = text.find_first_of("0123456789");
  std::size_t end = text.find_first_not_of("0123456789", start);
  end = end == std::string::npos ? text.size() : end;
  constexpr std::size_t kGroup = 3;
  for (std::size_t place = end; start != std::string::npos && place > start + kGroup;) {
    place -= kGroup;
    text.insert(place, kNarrowSpace);
  }
  return text;
}

}  // namespace

std::string htmlText(std::string_view text) {
  std::string html;
  char escape[16];
  while (!text.empty()) {
    const std::size_t length = xmlCharacterLength(text);
    const std::string_view character = text.substr(0, length == 0 ? 1 : length);
    const char32_t value = decoded(character);
    const bool isByte = length == 0 && value > 0x7F;
    if (isByte || isUnseen(value)) {
      std::snprintf(escape, sizeof escape, isByte ? "\\x%02x" : "\\u{%X}",
                    static_cast<unsigned>(value));
      html += escape;
    } else {
      appendEscaped(character, html);
    }
    text.remove_prefix(character.size());
  }
  return html;
}

bool isLongName(std::string_view name) { return name.size() > kLongestName; }

std::string htmlName(std::string_view name) {
  if (name.empty()) {
    return "<i>empty</i>";
  }
  if (!isLongName(name)) {
    return "<bdi>" + htmlText(name) + "</bdi>";
  }
  const std::string_view head = name.substr(0, characterStart(name, kShownHead));
  const std::string_view tail = name.substr(characterStart(name, name.size() - kShownTail));
  return "<bdi>" + htmlText(head) + "</bdi> <small>… " + numeral(name.size()) +
         " bytes …</small> <bdi>" + htmlText(tail) + "</bdi>";
}

std::string numeral(const Number& number) {
  return number.isFloatingPoint() ? numeral(number.asDouble()) : grouped(textForm(number));
}

std::string numeral(double value) {
  constexpr double kLeastWithoutFraction = 1e5;
  constexpr double kLeastWithExponent = 1e15;
  const double size = std::abs(value);
  char digits[64];
  const bool isWhole = size >= kLeastWithoutFraction && size < kLeastWithExponent;
  std::snprintf(digits, sizeof digits, isWhole ? "%.0f" : "%.6g", value);
  return grouped(digits);
}

std::string numeral(std::size_t count) { return grouped(std::to_string(count)); }

std::string countedNoun(std::size_t count, const char* noun) {
  return numeral(count) + ' ' + noun + (count == 1 ? "" : "s");
}

std::string dayText(std::int32_t day) {
  const std::string text = dateText(startOfDay(day));
  return text.substr(0, text.find('T'));
}

std::string minuteText(const Date& date) {
  std::string text = dateText(date);
  const std::size_t time = text.find('T');
  text.replace(time, 1, " ");
  return text.substr(0, time + 6);
}

}  // namespace vesprun
