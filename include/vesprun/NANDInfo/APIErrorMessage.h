#pragma once

#include <string>

#include "../Export.h"

namespace vesprun {

/// The first error text of the process, or "NA". By convention it begins with the name of the
/// operation that failed. Needs no device; empty when memory runs out.
VESPRUN_EXPORT std::string GetAPIErrorMessage() noexcept;

}  // namespace vesprun
