#pragma once

#include <optional>
#include <string>
#include <string_view>
#include <vector>

namespace vesprun {

/// One fault of a whitelist, and where it lies.
struct WhitelistFinding {
  std::string group;
  std::optional<std::string> list;  ///< nothing when the fault is the group's
  std::optional<std::string> key;   ///< or prefix; nothing when the fault lies above the entries
  const char* finding;
  std::string detail;  ///< for people: what it does and what to do
};

/// What is wrong or useless in a whitelist document, in its order. It is judged as if no group were
/// switched off; "InternalTesting", which most devices skip, neither covers nor replaces entries of
/// other groups. Nothing, with a text in `error`, when the bytes are not a ptree document with
/// a dictionary at its root.
std::optional<std::vector<WhitelistFinding>> checkWhitelist(std::string_view bytes,
                                                            std::string& error);

}  // namespace vesprun
