#pragma once

#include <cstddef>
#include <string>
#include <string_view>
#include <vector>

namespace vesprun {

/// Dictionaries and arrays may lie in one another this deep, in ptree documents and in JSON.
inline constexpr std::size_t kMostNestedLevels = 200;
inline constexpr const char* kNestedTooDeeply = "nested deeper than 200 levels";

/// The way to a place in a value. It is told from the inside out, as a recursive walk meets it when
/// it returns.
class NestedPlace {
 public:
  void addOuterKey(std::string_view key);
  void addOuterIndex(std::size_t index);

  /// "STEP > STEP: MESSAGE"; the innermost of more than 8 steps are left out.
  std::string with(const std::string& message) const;

 private:
  std::vector<std::string> _steps;
};

}  // namespace vesprun
