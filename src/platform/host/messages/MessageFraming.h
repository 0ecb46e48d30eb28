#pragma once

#include <cstddef>
#include <cstdint>
#include <optional>
#include <string>
#include <string_view>

namespace vesprun {

/// The longest document of a message, in bytes.
inline constexpr std::uint32_t kMaxMessageSize = 16 * 1024 * 1024;

/// A message on the wire: the document's length as a 32-bit little-endian number, then the
/// document. Nothing when it is too long.
std::optional<std::string> messageFrame(std::string_view document);

/// Assembles the messages of a peer from bytes in any pieces. Memory grows with the bytes that
/// came, not with the announced length.
class MessageAssembler {
 public:
  enum class Progress { Complete, Incomplete, TooLong };

  /// Takes bytes off the front until a message is complete or none are left. `TooLong`, known from
  /// the announced length, is final.
  Progress take(std::string_view& bytes);

  /// The document of the message just completed; the next one begins.
  std::string takeDocument();

  /// True after a part of a message.
  bool isInsideMessage() const { return !_frame.empty(); }

 private:
  bool fill(std::string_view& bytes, std::size_t length);

  std::string _frame;
};

}  // namespace vesprun
