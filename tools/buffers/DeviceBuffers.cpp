#include "buffers/DeviceBuffers.h"

#include "NANDInfo/parsers/MSPRecord.h"
#include "NANDInfo/parsers/StatisticsRecord.h"
#include "common/LittleEndian.h"

namespace vesprun {
namespace {

template <typename Builder, typename Table, typename ValuesOf>
Bytes everyRow(const Table& table, std::uint16_t Table::value_type::*id, const ValuesOf& valuesOf) {
  Builder buffer;
  for (const auto& key : table) {
    std::vector<std::uint64_t> values = valuesOf(key);
    values.resize(key.count);
    buffer.add(key.*id, values);
  }
  return buffer.bytes();
}

}  // namespace

StatisticsBufferBuilder& StatisticsBufferBuilder::add(std::uint32_t id,
                                                      std::span<const std::uint64_t> words) {
  addHeader(id, static_cast<std::uint32_t>(words.size()));
  for (const std::uint64_t word : words) {
    addWord(word);
  }
  return *this;
}

StatisticsBufferBuilder& StatisticsBufferBuilder::addHeader(std::uint32_t id, std::uint32_t count) {
  return addWord(StatisticsRecordHeader{id, count}.encode());
}

StatisticsBufferBuilder& StatisticsBufferBuilder::addWord(std::uint64_t word) {
  appendLittleEndian(_bytes, word, sizeof word);
  return *this;
}

MSPBufferBuilder& MSPBufferBuilder::add(std::uint16_t key,
                                        std::span<const std::uint64_t> elements) {
  const std::size_t width = ORUMSPKey{key, ""}.width();
  addHeader(key, static_cast<std::uint16_t>(elements.size() * width));
  for (const std::uint64_t element : elements) {
    appendLittleEndian(_bytes, element, width);
  }
  return *this;
}

MSPBufferBuilder& MSPBufferBuilder::addHeader(std::uint16_t key, std::uint16_t length) {
  appendLittleEndian(_bytes, MSPRecordHeader{key, length}.encode(), MSPRecordHeader::kSize);
  return *this;
}

MSPBufferBuilder& MSPBufferBuilder::addBytes(std::size_t count, std::uint8_t byte) {
  _bytes.insert(_bytes.end(), count, byte);
  return *this;
}

Bytes everyStatistic(const std::function<std::vector<std::uint64_t>(const ORUStatKey&)>& valuesOf) {
  return everyRow<StatisticsBufferBuilder>(ORUStatKeyTable, &ORUStatKey::id, valuesOf);
}

Bytes everyMSPStatistic(
    const std::function<std::vector<std::uint64_t>(const ORUMSPKey&)>& valuesOf) {
  return everyRow<MSPBufferBuilder>(ORUMSPKeyTable, &ORUMSPKey::key, valuesOf);
}

SnapshotBuilder& SnapshotBuilder::item(std::uint32_t type, const Bytes& data, std::uint64_t flags) {
  appendLittleEndian(bytes, type, 4);
  appendLittleEndian(bytes, data.size(), 4);
  appendLittleEndian(bytes, flags, 8);
  bytes.insert(bytes.end(), data.begin(), data.end());
  return *this;
}

SnapshotBuilder& SnapshotBuilder::name(std::string_view text, std::size_t size) {
  Bytes data(text.begin(), text.end());
  data.resize(size != 0 ? size : text.size());
  return item(2313, data);
}

SnapshotBuilder& SnapshotBuilder::ioStatistics(const std::array<std::uint64_t, 4>& counters) {
  Bytes data;
  for (const std::uint64_t counter : counters) {
    appendLittleEndian(data, counter, 8);
  }
  return item(2305, data);
}

Bytes bytesOf(std::span<const std::uint32_t> words) {
  Bytes bytes;
  for (const std::uint32_t word : words) {
    appendLittleEndian(bytes, word, sizeof word);
  }
  return bytes;
}

Bytes telemetryList(std::uint32_t busCount, const ListWord& counter, const ListWord& entry) {
  std::vector<std::uint32_t> words;
  const auto add = [&](std::uint32_t wordCount, const ListWord& wordOf) {
    for (std::uint32_t bus = 0; bus < busCount; ++bus) {
      for (std::uint32_t word = 0; word < wordCount; ++word) {
        words.push_back(wordOf(bus, word));
      }
    }
  };
  add(1024, counter);
  add(8, entry);
  return bytesOf(words);
}

Bytes telemetryList(std::uint32_t busCount) {
  return telemetryList(
      busCount, [](std::uint32_t /*bus*/, std::uint32_t word) { return word; },
      [](std::uint32_t bus, std::uint32_t word) {
        return word < 6 ? 10 * word + bus : 0xFFFFFFFF;
      });
}

}  // namespace vesprun
