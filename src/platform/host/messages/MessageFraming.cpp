#include "platform/host/messages/MessageFraming.h"

#include <algorithm>
#include <bit>
#include <utility>

#include "common/LittleEndian.h"

namespace vesprun {

std::optional<std::string> messageFrame(std::string_view document) {
  if (document.size() > kLongestMessage) {
    return std::nullopt;
  }
  const auto length = static_cast<std::uint32_t>(document.size());
  std::string frame;
  frame.reserve(sizeof length + document.size());
  for (unsigned shift = 0; shift < 32; shift += 8) {
    frame.push_back(static_cast<char>(static_cast<unsigned char>(length >> shift)));
  }
  return frame.append(document);
}

std::uint32_t MessageAssembler::announcedLength() const {
  return loadLittleEndian<std::uint32_t>(
      std::bit_cast<std::array<std::uint8_t, 4>>(_length).data());
}

MessageAssembler::Progress MessageAssembler::take(std::string_view& bytes) {
  const std::size_t lengthPart = std::min(_length.size() - _lengthBytes, bytes.size());
  bytes.copy(_length.data() + _lengthBytes, lengthPart);
  bytes.remove_prefix(lengthPart);
  _lengthBytes += lengthPart;
  if (_lengthBytes < _length.size()) {
    return Progress::Incomplete;
  }
  if (announcedLength() > kLongestMessage) {
    return Progress::TooLong;
  }
  const std::size_t documentPart = std::min(announcedLength() - _document.size(), bytes.size());
  _document.append(bytes.substr(0, documentPart));
  bytes.remove_prefix(documentPart);
  return _document.size() == announcedLength() ? Progress::Complete : Progress::Incomplete;
}

std::string MessageAssembler::takeDocument() {
  _lengthBytes = 0;
  return std::exchange(_document, {});
}

}  // namespace vesprun
