#include "platform/host/documents/Base64.h"

#include <algorithm>
#include <array>
#include <cstddef>
#include <utility>

namespace vesprun {
namespace {

constexpr std::string_view kDigits =
    "ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789+/";

constexpr std::array<std::uint8_t, 256> kValueOf = [] {
  std::array<std::uint8_t, 256> values{};
  for (std::size_t digit = 0; digit < kDigits.size(); ++digit) {
    values[static_cast<std::uint8_t>(kDigits[digit])] = static_cast<std::uint8_t>(digit);
  }
  return values;
}();

}  // namespace

void appendBase64(std::span<const std::uint8_t> data, std::string& text) {
  text.reserve(text.size() + (data.size() + 2) / 3 * 4);
  for (std::size_t at = 0; at < data.size(); at += 3) {
    const std::size_t count = data.size() - at;
    const std::uint32_t group = static_cast<std::uint32_t>(data[at]) << 16 |
                                (count > 1 ? static_cast<std::uint32_t>(data[at + 1]) << 8 : 0U) |
                                (count > 2 ? data[at + 2] : 0U);
    const char digits[] = {kDigits[group >> 18], kDigits[group >> 12 & 63],
                           count > 1 ? kDigits[group >> 6 & 63] : '=',
                           count > 2 ? kDigits[group & 63] : '='};
    text.append(digits, sizeof digits);
  }
}

std::optional<Bytes> parseBase64(std::string_view text) {
  std::string digits(text);
  std::erase_if(digits, [](char c) { return c == ' ' || c == '\t' || c == '\n' || c == '\r'; });
  Bytes data(digits.size() / 4 * 3);
  for (std::size_t at = 0; at < data.size(); at += 3) {
    std::uint32_t group = 0;
    for (std::size_t digit = at / 3 * 4; digit < at / 3 * 4 + 4; ++digit) {
      group = group << 6 | kValueOf[static_cast<std::uint8_t>(digits[digit])];
    }
    data[at] = static_cast<std::uint8_t>(group >> 16);
    data[at + 1] = static_cast<std::uint8_t>(group >> 8);
    data[at + 2] = static_cast<std::uint8_t>(group);
  }
  const std::size_t padding = digits.ends_with("==") ? 2 : digits.ends_with('=') ? 1 : 0;
  data.resize(data.size() - std::min(padding, data.size()));
  // Any fault in the text, such as a character that is not base64, is one that these bytes do not
  // have.
  std::string sound;
  appendBase64(data, sound);
  return sound == digits ? std::optional(std::move(data)) : std::nullopt;
}

}  // namespace vesprun
