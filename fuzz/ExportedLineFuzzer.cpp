#include <cmath>
#include <string_view>

#include "Require.h"
#include "vespfleet/store/ExportedLine.h"

using namespace vesprun;

/// A line is taken whole or refused with a reason, and nothing that is not finite gets through.
extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* bytes, std::size_t size) {
  const std::string_view text(reinterpret_cast<const char*>(bytes), size);
  std::string why;
  const auto line = parseExportedLine(text, why);
  require(line.has_value() == why.empty(), "a refusal has a reason", why.c_str());
  if (!line) {
    return 0;
  }
  require(line->size == text.size() && !line->device.empty() && line->revision >= 1,
          "a line is whole");
  for (const ReportedScalar& scalar : line->scalars) {
    require(!scalar.key.empty(), "a scalar has a key");
  }
  for (const ReportedDistribution& distribution : line->distributions) {
    require(!distribution.key.empty() && std::isfinite(distribution.values.statistics.mean),
            "a distribution has a key and numbers");
  }
  return 0;
}
