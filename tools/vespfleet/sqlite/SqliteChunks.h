#pragma once

#include <zlib.h>

#include <cstdint>
#include <limits>
#include <new>
#include <span>
#include <stdexcept>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

#include "store/FleetStore.h"
#include "store/Varint.h"

namespace vesprun {

// The number of a chunk: its day, its key, and which of the key's chunks of that day it is.
inline constexpr int kPartBits = 22;
inline constexpr int kKeyBits = 24;
inline constexpr std::int64_t kMaxKeyNumber = (std::int64_t{1} << kKeyBits) - 1;

/// The number of the first chunk of a day, or of a key in it.
constexpr std::int64_t chunkNumber(std::int64_t day, std::int64_t key = 0) {
  return (day << kKeyBits | key) << kPartBits;
}

constexpr std::int64_t keyOfChunk(std::int64_t number) {
  return number >> kPartBits & kMaxKeyNumber;
}

inline std::span<const std::uint8_t> asBytes(std::string_view text) {
  return {reinterpret_cast<const std::uint8_t*>(text.data()), text.size()};
}

/// Behind the unpacked size.
inline std::string packed(std::string_view text) {
  uLongf size = compressBound(text.size());
  std::string bytes;
  appendVarint(bytes, text.size());
  const std::size_t begin = bytes.size();
  bytes.resize(begin + size);
  if (compress2(reinterpret_cast<Bytef*>(bytes.data() + begin), &size,
                reinterpret_cast<const Bytef*>(text.data()), text.size(), Z_BEST_SPEED) != Z_OK) {
    throw std::bad_alloc();
  }
  bytes.resize(begin + size);
  return bytes;
}

inline std::string unpacked(std::span<const std::uint8_t> bytes, std::uint64_t size) {
  constexpr std::uint64_t kMaxRatio = 1100;  // of what zlib packs
  std::string text;
  if (size > bytes.size() * kMaxRatio) {
    throw std::out_of_range("a chunk that does not unpack");
  }
  text.resize(size);
  uLongf length = text.size();
  if (uncompress(reinterpret_cast<Bytef*>(text.data()), &length, bytes.data(), bytes.size()) !=
          Z_OK ||
      length != text.size()) {
    throw std::out_of_range("a chunk that does not unpack");
  }
  return text;
}

inline std::string unpacked(std::span<const std::uint8_t> bytes) {
  PackedReader reader({reinterpret_cast<const char*>(bytes.data()), bytes.size()});
  const std::uint64_t size = reader.varint();
  return unpacked(bytes.subspan(static_cast<std::size_t>(
                      reader.position() - reinterpret_cast<const char*>(bytes.data()))),
                  size);
}

/// Labels by their numbers in `text`.
struct PackedDistribution {
  Statistics statistics;
  bool hasHistogram = false;
  std::vector<std::pair<std::int64_t, std::uint64_t>> counts;
};

inline PackedDistribution readDistribution(PackedReader& entries) {
  PackedDistribution value;
  value.statistics.minimum = entries.raw<double>();
  value.statistics.maximum = entries.raw<double>();
  value.statistics.mean = entries.raw<double>();
  value.statistics.deviations = entries.raw<double>();
  value.statistics.count = static_cast<std::int64_t>(entries.varint());
  std::uint64_t labels = entries.varint();
  value.hasHistogram = labels != 0;
  for (; labels > 1; --labels) {
    const auto label = static_cast<std::int64_t>(entries.varint());
    value.counts.emplace_back(label, entries.varint());
  }
  return value;
}

}  // namespace vesprun
