#include "platform/host/documents/Base64.h"

#include <array>
#include <cstddef>

namespace vesprun {
namespace {

constexpr std::string_view kDigits =
    "ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789+/";
constexpr std::uint8_t kNoDigit = 0xFF;

constexpr std::array<std::uint8_t, 256> kValueOf = [] {
  std::array<std::uint8_t, 256> values{};
  values.fill(kNoDigit);
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
    text += kDigits[group >> 18];
    text += kDigits[group >> 12 & 63];
    text += count > 1 ? kDigits[group >> 6 & 63] : '=';
    text += count > 2 ? kDigits[group & 63] : '=';
  }
}

std::optional<Bytes> parseBase64(std::string_view text) {
  Bytes data;
  data.reserve(text.size() / 4 * 3);
  std::uint32_t group = 0;
  unsigned digits = 0;  // in the group so far, padding included
  unsigned padding = 0;
  for (const char c : text) {
    if (c == ' ' || c == '\t' || c == '\n' || c == '\r') {
      continue;
    }
    const std::uint8_t value = kValueOf[static_cast<std::uint8_t>(c)];
    if (c == '=') {
      ++padding;
    } else if (value == kNoDigit || padding != 0) {
      return std::nullopt;
    }
    group = group << 6 | (c == '=' ? 0U : value);
    if (++digits < 4) {
      continue;
    }
    if (padding > 2 || (padding == 2 && (group & 0xFFFF) != 0) ||
        (padding == 1 && (group & 0xFF) != 0)) {
      return std::nullopt;
    }
    for (unsigned byte = 0; byte < 3 - padding; ++byte) {
      data.push_back(static_cast<std::uint8_t>(group >> (16 - 8 * byte)));
    }
    group = 0;
    digits = 0;
    if (padding != 0) {
      padding = 3;  // whatever follows is one too many
    }
  }
  return digits == 0 ? std::optional(std::move(data)) : std::nullopt;
}

}  // namespace vesprun
