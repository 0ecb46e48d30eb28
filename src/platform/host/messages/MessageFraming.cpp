#include "platform/host/messages/MessageFraming.h"

#include <algorithm>
#include <utility>
#include <vector>

#include "common/LittleEndian.h"

namespace vesprun {

namespace {

constexpr std::size_t kLengthSize = sizeof(std::uint32_t);

}  // namespace

std::optional<std::string> messageFrame(std::string_view document) {
  if (document.size() > kMaxMessageSize) {
    return std::nullopt;
  }
  std::vector<std::uint8_t> length;
  appendLittleEndian(length, document.size(), kLengthSize);
  return std::string(length.begin(), length.end()).append(document);
}

bool MessageAssembler::fill(std::string_view& bytes, std::size_t length) {
  const std::size_t part = std::min(length - _frame.size(), bytes.size());
  _frame.append(bytes.substr(0, part));
  bytes.remove_prefix(part);
  return _frame.size() == length;
}

MessageAssembler::Progress MessageAssembler::take(std::string_view& bytes) {
  if (_frame.size() < kLengthSize && !fill(bytes, kLengthSize)) {
    return Progress::Incomplete;
  }
  const auto length =
      loadLittleEndian<std::uint32_t>(reinterpret_cast<const std::uint8_t*>(_frame.data()));
  if (length > kMaxMessageSize) {
    return Progress::TooLong;
  }
  return fill(bytes, kLengthSize + length) ? Progress::Complete : Progress::Incomplete;
}

std::string MessageAssembler::takeDocument() {
  return std::exchange(_frame, {}).erase(0, kLengthSize);
}

}  // namespace vesprun
