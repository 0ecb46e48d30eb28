#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>

namespace vesprun {

/// The name of a file in `outbox/logs`: NNNN-TYPE-NAME and what it ends in.
struct LogName {
  enum class End { Ptree, Text, Header };

  std::string base;          ///< without the end: a log and its header have the same
  std::uint64_t number = 0;  ///< that it begins with
  End end = End::Ptree;

  /// Nothing for other names.
  static std::optional<LogName> parse(std::string_view text);

  std::string text() const;

  /// "TYPE-NAME".
  std::string_view kind() const { return std::string_view(base).substr(base.find('-') + 1); }
  bool isDailyLog() const;
};

/// The number that a name begins with, whatever follows it.
std::optional<std::uint64_t> logNumber(std::string_view name);

/// The base of the log with that number.
std::string logBase(std::uint64_t number, std::string_view type, std::string_view name);

}  // namespace vesprun
