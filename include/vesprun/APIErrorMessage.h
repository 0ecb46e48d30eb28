#pragma once

#include <string>

#include "Export.h"

namespace vesprun {

/// The first error text of the process, or "NA". By convention it begins with the failed
/// operation's name. Needs no device; empty when memory runs out.
VESPRUN_EXPORT std::string GetAPIErrorMessage() noexcept;

}  // namespace vesprun
