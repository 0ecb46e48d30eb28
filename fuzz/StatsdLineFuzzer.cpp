#include <algorithm>
#include <cmath>

#include "ExactCopy.h"
#include "Require.h"
#include "listen/StatsdLine.h"

using namespace vesprun;

/// A line that counts has a key that is a part of it, and values of one kind that are numbers.
extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* bytes, std::size_t size) {
  const ExactCopy copy(bytes, size);
  const std::string_view text(reinterpret_cast<const char*>(copy.span().data()), size);
  StatsdLine line;
  if (!parseStatsdLine(text, line)) {
    require(!line.key.empty() && text.starts_with(line.key) && text[line.key.size()] == ':' &&
                line.key.find_first_of(":|") == std::string_view::npos,
            "the key is the begin of the line");
    require(line.integers.empty() == (line.change == StatsdLine::Change::Append) &&
                line.numbers.empty() == (line.change != StatsdLine::Change::Append),
            "it has values of its kind");
    require(std::ranges::all_of(line.numbers, [](double value) { return std::isfinite(value); }),
            "its values are finite");
  }
  return 0;
}
