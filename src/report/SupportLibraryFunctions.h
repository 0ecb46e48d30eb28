#pragma once

namespace vesprun {

/// Resolves the two preference functions of the crash-report support library. False, with an error
/// line for each missing part, until both are there; then the library is not asked again.
bool resolveSupportLibraryFunctions();

}  // namespace vesprun
