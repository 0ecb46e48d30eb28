#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "Statistics.h"
#include "common/PropertyValue.h"

namespace vesprun {

/// A counter that a device reported for one day.
struct ReportedScalar {
  std::string key;
  std::int64_t value = 0;
};

/// A distribution that a device reported for one day.
struct ReportedDistribution {
  std::string key;
  Distribution values;
};

/// What one device reported for one day in one revision, as `vespctl export` writes it.
struct ExportedLine {
  std::string text;  ///< the line itself, without its end
  std::string device;
  std::int32_t day = 0;  ///< days since 1970
  std::int64_t revision = 0;
  Date created;
  std::vector<ReportedScalar> scalars;
  std::vector<ReportedDistribution> distributions;
};

/// Reads a line. Nothing, with a reason in `why` that quotes nothing of the line, when it is
/// malformed. Distributions without values or with a number that is not finite are left out.
std::optional<ExportedLine> parseExportedLine(std::string_view text, std::string& why);

}  // namespace vesprun
