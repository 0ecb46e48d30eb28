#pragma once

#include <cstdint>
#include <optional>
#include <string_view>
#include <vector>

namespace vesprun {

/// Why a line is not counted; of several reasons the first.
enum class DropReason : std::uint8_t { Form, Kind, Rights, Bounds };

/// `KEY:VALUE|TYPE`, with several values separated by colons, and `|@RATE` behind the type `c`.
struct StatsdLine {
  enum class Change : std::uint8_t {
    Add,     ///< adds each of `integers` to a scalar
    Set,     ///< sets a scalar to each of `integers`, one after the other
    Append,  ///< adds each of `numbers` to a distribution
  };

  std::string_view key;  ///< a part of the line
  Change change{};
  std::vector<std::int64_t> integers;  ///< already divided by the rate
  std::vector<double> numbers;
};

/// Reads a line into `parsed`, whose memory is used again. Nothing when it can be counted, as far
/// as its text tells: whether an XML document can carry the key is left to the caller.
std::optional<DropReason> parseStatsdLine(std::string_view line, StatsdLine& parsed);

}  // namespace vesprun
