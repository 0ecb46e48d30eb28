#pragma once

#include <array>
#include <cstddef>
#include <cstdint>
#include <functional>
#include <initializer_list>
#include <span>
#include <string_view>
#include <vector>

#include "NANDInfo/parsers/ORUMSPKeyTable.h"
#include "NANDInfo/parsers/ORUStatKeyTable.h"
#include "vesprun/PropertyValue.h"

namespace vesprun {

// Buffers as the storage controller and the kernel send them, for sample devices, tests, fuzzers
// and benchmarks. Nothing is checked.

/// Base and FTL statistics.
class StatisticsBufferBuilder {
 public:
  /// A record of these words.
  StatisticsBufferBuilder& add(std::uint32_t id, std::span<const std::uint64_t> words);
  StatisticsBufferBuilder& add(std::uint32_t id, std::initializer_list<std::uint64_t> words) {
    return add(id, std::span(words.begin(), words.size()));
  }
  /// A header alone.
  StatisticsBufferBuilder& addHeader(std::uint32_t id, std::uint32_t count);
  StatisticsBufferBuilder& addWord(std::uint64_t word);

  const Bytes& bytes() const { return _bytes; }

 private:
  Bytes _bytes;
};

/// Statistics of an MSP.
class MSPBufferBuilder {
 public:
  /// A record of these elements, each as wide as the key's group.
  MSPBufferBuilder& add(std::uint16_t key, std::span<const std::uint64_t> elements);
  MSPBufferBuilder& add(std::uint16_t key, std::initializer_list<std::uint64_t> elements) {
    return add(key, std::span(elements.begin(), elements.size()));
  }
  /// A header alone.
  MSPBufferBuilder& addHeader(std::uint16_t key, std::uint16_t length);
  /// The same byte `count` times.
  MSPBufferBuilder& addBytes(std::size_t count, std::uint8_t byte = 0);

  const Bytes& bytes() const { return _bytes; }

 private:
  Bytes _bytes;
};

/// A full record of every known statistic in table order. Elements missing in `valuesOf` are 0.
Bytes everyStatistic(const std::function<std::vector<std::uint64_t>(const ORUStatKey&)>& valuesOf);
Bytes everyMSPStatistic(
    const std::function<std::vector<std::uint64_t>(const ORUMSPKey&)>& valuesOf);

/// A snapshot of the kernel, item by item.
class SnapshotBuilder {
 public:
  SnapshotBuilder& item(std::uint32_t type, const Bytes& data, std::uint64_t flags = 0);
  SnapshotBuilder& begin(std::uint64_t id) { return item(19, Bytes(4), id); }
  SnapshotBuilder& end(std::uint64_t id) { return item(20, {}, id); }
  SnapshotBuilder& bufferEnd() { return item(0xF19158ED, {}); }
  /// An item of `size` bytes, padded with zeros; 0: as long as the text.
  SnapshotBuilder& name(std::string_view text, std::size_t size = 0);
  /// The fourth counter is the number of bytes written.
  SnapshotBuilder& ioStatistics(const std::array<std::uint64_t, 4>& counters);
  SnapshotBuilder& written(std::uint64_t count) { return ioStatistics({0, 0, 0, count}); }
  SnapshotBuilder& thread(std::uint64_t id, std::string_view text, std::uint64_t count) {
    return begin(id).name(text, 16).written(count).end(id);
  }

  Bytes bytes;
};

/// 32-bit words.
Bytes bytesOf(std::span<const std::uint32_t> words);
inline Bytes bytesOf(std::initializer_list<std::uint32_t> words) {
  return bytesOf(std::span(words.begin(), words.size()));
}

/// A telemetry list: 1,024 counter words for each bus, then an entry of eight words for each.
using ListWord = std::function<std::uint32_t(std::uint32_t bus, std::uint32_t word)>;
Bytes telemetryList(std::uint32_t busCount, const ListWord& counter, const ListWord& entry);

/// Word i of each bus's counters is i; bus entry b is b, 10 + b, 20 + b and so on, the last two
/// words 0xFFFFFFFF.
Bytes telemetryList(std::uint32_t busCount);

}  // namespace vesprun
