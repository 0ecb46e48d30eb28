#pragma once

#include <array>
#include <cstdint>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "Statistics.h"
#include "vesprun/PropertyValue.h"

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

using LineDigest = std::array<std::uint8_t, 32>;

/// SHA-256.
LineDigest digestOf(std::string_view text);

inline constexpr std::size_t kMaxExportedLine = std::size_t{16} * 1024 * 1024;

/// What one device reported for one day in one revision, as `vespctl export` writes it.
struct ExportedLine {
  LineDigest digest{};   ///< of the line's text, without its end
  std::size_t size = 0;  ///< of that text
  std::string device;
  std::int32_t day = 0;  ///< days since 1970
  std::int64_t revision = 0;
  Date created;
  std::optional<std::string> build;
  std::optional<std::string> model;
  std::string whitelist;
  std::vector<ReportedScalar> scalars;
  std::vector<ReportedDistribution> distributions;
};

/// Reads a line. Nothing, with a reason in `why` that quotes nothing of the line, when it is
/// malformed. Distributions without values or with a number that is not finite are left out.
/// Version 1, of earlier stores, has neither build nor model.
std::optional<ExportedLine> parseExportedLine(std::string_view text, std::string& why,
                                              int version = 2);

}  // namespace vesprun
