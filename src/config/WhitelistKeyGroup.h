#pragma once

#include <string>

#include "common/PropertyDict.h"

namespace vesprun {

/// A named group of the whitelist document, which it lies in.
struct WhitelistKeyGroup {
  enum class Standing { Taken, InternalDevicesOnly, DisabledByTasking };

  /// Whether the group counts on this device: on an internal one every group does. On others
  /// "InternalTesting" does not, nor a group whose preference in "com.quill.da" is there and false.
  Standing standing(bool isInternalDevice) const;

  /// True for the group that counts on internal devices alone.
  bool isForInternalDevices() const { return name == "InternalTesting"; }

  const std::string& name;
  const PropertyValue& lists;  ///< a dictionary, or else the group is to be skipped
};

}  // namespace vesprun
