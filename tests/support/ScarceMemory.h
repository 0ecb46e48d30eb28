#pragma once

#include <cstddef>

namespace vesprun {

// What `operator new` of the test programs gives out.
extern std::size_t largestAllocation;             ///< larger ones fail
extern thread_local std::size_t allocationsLeft;  ///< the last of them fails; 0: all succeed

}  // namespace vesprun
