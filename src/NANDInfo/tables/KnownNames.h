#pragma once

#include <cstddef>
#include <cstdint>
#include <string_view>

namespace vesprun {

/// The names of one statistic's elements. They live as long as the program.
class KnownNames {
 public:
  // Offsets and not pointers, which the loader would have to relocate at each start.
  struct Place {
    std::uint32_t begin = 0;
    std::uint16_t size = 0;
    std::uint16_t row = 0;
  };

  constexpr KnownNames() = default;
  constexpr KnownNames(const char* text, const Place* places) : _text(text), _places(places) {}
  bool isKnown() const { return _text != nullptr; }
  std::string_view text(std::size_t element) const {
    return {_text + _places[element].begin, _places[element].size};
  }
  /// `rowOfField` of the name.
  std::uint16_t row(std::size_t element) const { return _places[element].row; }

 private:
  const char* _text = nullptr;
  const Place* _places = nullptr;
};

}  // namespace vesprun
