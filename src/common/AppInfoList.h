#pragma once

#include "common/PropertyValue.h"

namespace vesprun {

/// The actively used apps: for each a dictionary with "bundle", "version", "adamID", "arch" and
/// "uuid".
using AppInfoList = PropertyArray;

}  // namespace vesprun
