#include "common/TextForm.h"

#include <charconv>
#include <cmath>
#include <concepts>
#include <cstdlib>
#include <string_view>

#include "common/Calendar.h"
#include "common/HexText.h"

namespace vesprun {
namespace {

template <std::integral T>
std::string decimalText(T value) {
  char text[24];
  return {text, std::to_chars(text, text + sizeof text, value).ptr};
}

/// The fewest digits that read back to `value`; an exponent only where plain digits would pad with
/// zeros.
template <std::floating_point T>
std::string shortestText(T value) {
  if (std::isnan(value)) {
    return "nan";
  }
  char text[64];
  const char* end =
      std::to_chars(text, text + sizeof text, value, std::chars_format::scientific).ptr;
  const std::string_view scientific(text, static_cast<std::size_t>(end - text));
  const auto exponentMark = scientific.find('e');
  if (exponentMark == std::string_view::npos) {
    return std::string(scientific);  // an infinity
  }
  const int exponent = std::atoi(std::string(scientific.substr(exponentMark + 1)).c_str());
  if (exponent < -4 || exponent >= 17) {
    return std::string(scientific);
  }
  end = std::to_chars(text, text + sizeof text, value, std::chars_format::fixed).ptr;
  return {text, static_cast<std::size_t>(end - text)};
}

std::string spacedDateText(const Date& date) {
  std::string text = dateText({date.seconds, 0});
  text.pop_back();
  text[text.find('T')] = ' ';
  return text + " +0000";
}

}  // namespace

std::string hexadecimalText(std::span<const std::uint8_t> bytes) {
  std::string text;
  for (const std::uint8_t byte : bytes) {
    appendHex(text, byte);
  }
  return text;
}

std::string textForm(const Number& number) {
  switch (number.kind()) {
    case NumberKind::Float:
      return shortestText(static_cast<float>(number.asDouble()));
    case NumberKind::Double:
      return shortestText(number.asDouble());
    default:
      return number.isSigned() ? decimalText(number.asInt64()) : decimalText(number.asUInt64());
  }
}

std::string textForm(const PropertyValue& value) {
  if (const std::string* string = value.string()) {
    return *string;
  }
  if (const Number* number = value.number()) {
    return textForm(*number);
  }
  if (const bool* boolean = value.boolean()) {
    return *boolean ? "1" : "0";
  }
  if (const Date* date = value.date()) {
    return spacedDateText(*date);
  }
  if (const Bytes* data = value.data()) {
    return '<' + hexadecimalText(*data) + '>';
  }
  std::string text;
  if (const PropertyArray* array = value.array()) {
    for (const PropertyValue& element : *array) {
      text += (text.empty() ? "" : ", ") + textForm(element);
    }
    return '(' + text + ')';
  }
  for (const auto& [key, entry] : *value.dict()) {
    text += (text.empty() ? "" : "; ") + key + " = " + textForm(entry);
  }
  return '{' + text + '}';
}

std::string textFormOrNull(const std::optional<PropertyValue>& value) {
  return value ? textForm(*value) : "(null)";
}

}  // namespace vesprun
