#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "whitelist/WhitelistDocument.h"

namespace vesprun {

/// One fault of a whitelist, and where it lies. The names are the document's own.
struct WhitelistFinding {
  std::string_view group;
  std::optional<std::string_view> list;  ///< nothing when the fault is the group's
  std::optional<std::string_view> key;   ///< or prefix; nothing when the fault lies above them
  std::size_t line;
  std::string_view finding;
  std::string detail;  ///< for people: what follows from it and what to do

  /// Whether a key leaves otherwise than its entry says.
  bool isGrave() const;
};

/// "FILE:LINE: "group", list, "key": finding", for people.
std::string placeOf(const WhitelistFinding& finding, const std::string& file);

/// What is wrong or useless in a whitelist document, in its order. It is judged as if no group were
/// switched off; "InternalTesting", which most devices skip, neither covers nor replaces entries of
/// other groups. `required` names the metadata that each entry needs; what expired before the day
/// `today` is a finding.
std::vector<WhitelistFinding> checkWhitelist(const WhitelistDocument& document, std::int32_t today,
                                             const std::vector<std::string>& required = {});

}  // namespace vesprun
