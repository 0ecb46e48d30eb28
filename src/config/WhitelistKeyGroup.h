#pragma once

#include <string>

#include "common/PropertyDict.h"

namespace vesprun {

/// A group of the whitelist document.
struct WhitelistKeyGroup {
  enum class Standing { Taken, InternalDevicesOnly, DisabledByTasking };

  /// On an internal device every group counts. On others "InternalTesting" does not, nor a group
  /// with a false preference in "com.quill.da".
  Standing standing(bool isInternalDevice) const;

  /// True for the group that counts on internal devices alone.
  bool isForInternalDevices() const { return name == "InternalTesting"; }

  const std::string& name;
  const PropertyValue& lists;  ///< skipped unless it is a dictionary
};

}  // namespace vesprun
