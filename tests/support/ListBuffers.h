#pragma once

#include <cstdint>
#include <vector>

#include "common/PropertyValue.h"

namespace vesprun {

/// The bytes of little-endian words, as a storage controller sends them.
inline Bytes bytesOf(const std::vector<std::uint32_t>& words) {
  Bytes bytes;
  for (const std::uint32_t word : words) {
    for (unsigned shift = 0; shift < 32; shift += 8) {
      bytes.push_back(static_cast<std::uint8_t>(word >> shift));
    }
  }
  return bytes;
}

/// A telemetry list. Word i of a bus's counters is i; the words of bus entry b are b, 10 + b,
/// 20 + b and so on, but for the last two: 0xFFFFFFFF.
inline Bytes telemetryList(std::uint32_t busCount) {
  std::vector<std::uint32_t> words;
  for (std::uint32_t i = 0; i < busCount * 1024; ++i) {
    words.push_back(i % 1024);
  }
  for (std::uint32_t bus = 0; bus < busCount; ++bus) {
    for (std::uint32_t word = 0; word < 8; ++word) {
      words.push_back(word < 6 ? 10 * word + bus : 0xFFFFFFFF);
    }
  }
  return bytesOf(words);
}

}  // namespace vesprun
