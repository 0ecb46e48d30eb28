#pragma once

#include <cstdint>
#include <string>

#include "common/LittleEndian.h"
#include "common/PropertyValue.h"

namespace vesprun {

/// Puts together kernel snapshots, item by item.
class SnapshotBuilder {
 public:
  SnapshotBuilder& item(std::uint32_t type, const Bytes& data, std::uint64_t flags = 0) {
    appendLittleEndian(bytes, type, 4);
    appendLittleEndian(bytes, data.size(), 4);
    appendLittleEndian(bytes, flags, 8);
    bytes.insert(bytes.end(), data.begin(), data.end());
    return *this;
  }
  SnapshotBuilder& begin(std::uint64_t id) { return item(19, Bytes(4), id); }
  SnapshotBuilder& end(std::uint64_t id) { return item(20, {}, id); }
  SnapshotBuilder& bufferEnd() { return item(0xF19158ED, {}); }
  SnapshotBuilder& name(std::string text, std::size_t size = 0) {
    text.resize(size != 0 ? size : text.size());
    return item(2313, Bytes(text.begin(), text.end()));
  }
  SnapshotBuilder& written(std::uint8_t count) {
    Bytes counters(32);
    counters[24] = count;
    return item(2305, counters);
  }
  SnapshotBuilder& thread(std::uint64_t id, const std::string& text, std::uint8_t count) {
    return begin(id).name(text, 16).written(count).end(id);
  }

  Bytes bytes;
};

}  // namespace vesprun
