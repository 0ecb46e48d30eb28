#pragma once

#include <cstdint>
#include <initializer_list>
#include <span>

#include "common/PropertyValue.h"

namespace vesprun {

/// Puts together base and FTL statistics buffers as the storage controller sends them. Nothing is
/// checked: a header can claim what it likes.
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

/// The same for MSP buffers.
class MSPBufferBuilder {
 public:
  /// A record of these elements, each as wide as the key's group has them.
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

}  // namespace vesprun
