#pragma once

#include <cstdint>
#include <optional>
#include <span>
#include <string>
#include <string_view>

namespace vesprun {

/// What the figures of one report have in common.
struct FigureSource {
  std::string_view device;
  std::int32_t day = 0;  ///< days since 1970
  std::int64_t revision = 0;
  std::optional<std::string> build;
  std::optional<std::string> model;
};

/// Figures that devices reported as CSV (RFC 4180, with line feeds), one a row.
class FigureRows {
 public:
  static constexpr std::string_view kColumns =
      "device,day,date,revision,build,model,kind,key,field,value\n";

  explicit FigureRows(const FigureSource& source);

  void addScalar(std::string_view key, std::int64_t value);
  /// Minimum, maximum, mean and sum of squared deviations, and the count.
  void addDistribution(std::string_view key, std::span<const double, 4> statistics,
                       std::int64_t count);
  void addBucket(std::string_view key, std::string_view label, std::uint64_t count);

  const std::string& text() const { return _text; }

 private:
  void addRow(std::string_view kind, std::string_view key, std::string_view field,
              std::string_view value);

  std::string _source;  ///< the first six fields and their commas
  std::string _text;
};

}  // namespace vesprun
