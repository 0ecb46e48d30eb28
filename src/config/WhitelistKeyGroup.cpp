#include "config/WhitelistKeyGroup.h"

#include "platform/Platform.h"

namespace vesprun {

WhitelistKeyGroup::Standing WhitelistKeyGroup::standing(bool isInternalDevice) const {
  if (isInternalDevice) {
    return Standing::Taken;
  }
  if (isForInternalDevices(name)) {
    return Standing::InternalDevicesOnly;
  }
  bool found = false;
  const bool enabled =
      platform().preferences().LGSPreferencesGetBoolValue(name, "com.quill.da", found);
  return enabled || !found ? Standing::Taken : Standing::DisabledByTasking;
}

}  // namespace vesprun
