#pragma once

#include <cstdint>
#include <functional>
#include <map>
#include <set>
#include <string>
#include <vector>

#include "platform/host/figures/FigureTable.h"

namespace vesprun {

struct FigureReading {
  const LinuxFigure* figure;
  std::string place;  ///< file and field
  std::string key;
  std::int64_t device;  ///< what its device class calls the identity; 0 when it has none
  std::int64_t
      value;  ///< in the unit; `kUnread` when the device is there but the figure cannot be read
};

inline constexpr std::int64_t kUnread = -1;  ///< of a counter; no gauge is ever unread

/// What could be read of a system at one moment. Files that are missing, irregular, longer than
/// 256 KiB or anything but plain text are left out, and so are figures that are not numbers or out
/// of their range.
struct FigureReadings {
  std::vector<FigureReading> figures;  ///< counters and gauges, in the order of the table
  std::set<std::string_view> listed;   ///< each `file` with devices, when all of them are known
  std::string boot;                    ///< the identifier of the boot; empty when it is not known
  std::map<std::string, std::string> problems;  ///< what was left out of existing files, by path
};

/// Reads the figures of the system below `root` (empty: the running one), of the files for which
/// `wanted` takes their first figure.
FigureReadings readFigures(const std::string& root,
                           const std::function<bool(const LinuxFigure&)>& wanted);

/// Those of the running system by key, merged, without what could not be read.
std::map<std::string, std::int64_t> mergedFigures(
    const std::function<bool(const LinuxFigure&)>& wanted);

/// Adds a figure to those by key: the sum of those with one key counts, of gauges the highest.
void mergeFigure(std::map<std::string, std::int64_t>& figures, const LinuxFigure& figure,
                 const std::string& key, std::int64_t value);

}  // namespace vesprun
