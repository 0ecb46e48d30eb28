#include "NANDInfo/parsers/StatisticsBufferBuilder.h"

#include "NANDInfo/parsers/MSPRecord.h"
#include "NANDInfo/parsers/ORUMSPKeyTable.h"
#include "NANDInfo/parsers/StatisticsRecord.h"

namespace vesprun {

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
  appendLittleEndian(_bytes, key, sizeof key);
  appendLittleEndian(_bytes, length, sizeof length);
  static_assert(sizeof key + sizeof length == MSPRecordHeader::kSize);
  return *this;
}

MSPBufferBuilder& MSPBufferBuilder::addBytes(std::size_t count, std::uint8_t byte) {
  _bytes.insert(_bytes.end(), count, byte);
  return *this;
}

}  // namespace vesprun
