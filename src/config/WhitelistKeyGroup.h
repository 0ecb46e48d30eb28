#pragma once

#include <string>
#include <string_view>

#include "vesprun/PropertyDict.h"

namespace vesprun {

/// A group of the whitelist document.
struct WhitelistKeyGroup {
  enum class Standing { Taken, InternalDevicesOnly, DisabledByTasking };

  /// On an internal device every group applies. On others "InternalTesting" does not, nor a group
  /// with a false preference in "com.quill.da".
  Standing standing(bool isInternalDevice) const;

  /// True for the name of the group that applies to internal devices only.
  static bool isForInternalDevices(std::string_view name) { return name == "InternalTesting"; }

  const std::string& name;
  const PropertyValue& lists;  ///< skipped unless it is a dictionary
};

}  // namespace vesprun
