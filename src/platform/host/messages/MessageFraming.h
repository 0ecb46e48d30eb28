#pragma once

#include <array>
#include <cstddef>
#include <cstdint>
#include <optional>
#include <string>
#include <string_view>

namespace vesprun {

/// The longest document that a message may carry, in bytes.
inline constexpr std::uint32_t kLongestMessage = 16 * 1024 * 1024;

/// A message on the wire: the length of the document as a 32-bit little-endian number, then the
/// document. Nothing when the document is longer than a message may be.
std::optional<std::string> messageFrame(std::string_view document);

/// Puts the messages of one peer together from the bytes that arrive, in whatever pieces. Memory
/// grows with the bytes that have come, not with the length that was announced.
class MessageAssembler {
 public:
  enum class Progress { Complete, Incomplete, TooLong };

  /// Takes bytes off the front of `bytes` until a message is complete or there are none left. After
  /// `TooLong`, which an announced length is as soon as it is known, nothing more can be taken.
  Progress take(std::string_view& bytes);

  /// The document of the message that has just become complete; the next one begins.
  std::string takeDocument();

  /// True when a part of a message is here and the rest is not.
  bool isInsideMessage() const { return _lengthBytes != 0; }

 private:
  std::uint32_t announcedLength() const;

  std::array<char, 4> _length{};
  std::size_t _lengthBytes = 0;
  std::string _document;
};

}  // namespace vesprun
