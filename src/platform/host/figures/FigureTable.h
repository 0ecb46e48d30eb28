#pragma once

#include <cstdint>
#include <span>
#include <string_view>

namespace vesprun {

enum class FigureKind {
  Counter,  ///< only grows from the start of the system on
  Gauge,    ///< goes up and down
  Boots     ///< the identifier of the boot
};

/// One figure that Linux reports.
struct LinuxFigure {
  /// The file, with names of device classes such as "<disk>" as parts of its path.
  std::string_view file;
  /// "2": the second word of the first line. "cpu 2": of the line that begins with the word "cpu",
  /// the second word after it. "some total=": on the line "some", what follows "total=".
  std::string_view field;
  /// The counter key. One that ends in a dot goes on with the device's name. Counters with the same
  /// key are added up; of gauges the highest counts.
  std::string_view key;
  std::string_view unit;
  FigureKind kind;
  std::int64_t divisor;  ///< the number that the file shows for one unit
  std::int64_t lowest;   ///< in the unit; numbers outside are left out
  std::int64_t highest;
  std::string_view why;                    ///< what it is good for, in the whitelist's words
  std::span<const std::int32_t> bounds{};  ///< of the histogram of a gauge
  /// A field of the same file, 0 where the figure means nothing; it is left out then.
  std::string_view unlessZero{};
};

/// The devices that stand in a path for a name such as "<disk>".
struct DeviceClass {
  std::string_view name;
  /// Names of folders or files, separated by spaces. '#' is for digits, '@' for small letters, at
  /// least one each, and '*' for anything without a dot.
  std::string_view patterns;
  /// What a device is called in keys: "." as it is named here, else as this file in it says. Empty:
  /// it is not named.
  std::string_view namedBy;
  /// A file in the device whose number no later device of the same name has; may be empty.
  std::string_view identity;
};

/// All figures. Those of one file stand together, or the table does not compile.
extern const std::span<const LinuxFigure> linuxFigures;
extern const std::span<const DeviceClass> linuxDeviceClasses;

/// True if a name matches one of the patterns.
bool matchesPatterns(std::string_view name, std::string_view patterns);

}  // namespace vesprun
