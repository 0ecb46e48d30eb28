#pragma once

namespace vesprun {

/// Resolves the two preference functions of the crash-report support library. False, with an error
/// line for what is missing, unless both are there. Once they are, the library is not asked again;
/// until then every call tries anew.
bool resolveSupportLibraryFunctions();

}  // namespace vesprun
