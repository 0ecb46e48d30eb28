#pragma once

#include <cstddef>
#include <string>
#include <string_view>
#include <vector>

namespace vesprun {

/// How deep dictionaries and arrays may nest, in ptree documents and in JSON.
inline constexpr std::size_t kMostNestedLevels = 200;
inline constexpr const char* kNestedTooDeeply = "nested deeper than 200 levels";

/// The path to a place in a value, collected from the inside out as a recursive walk returns.
class NestedPlace {
 public:
  void addOuter(std::string_view key);
  void addOuter(std::size_t index);

  /// "STEP > STEP: MESSAGE" with the 8 outermost steps.
  std::string with(const std::string& message) const;

 private:
  std::vector<std::string> _steps;
};

}  // namespace vesprun
