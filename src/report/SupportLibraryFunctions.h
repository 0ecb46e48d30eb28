#pragma once

namespace vesprun {

/// Resolves the two preference functions of the crash-report support library. False, with an error
/// line for what is missing, unless both are there. Once they are, the library is not asked again;
/// until then every call tries anew.
bool resolveSupportLibraryFunctions();

/// Lets the next call ask the library again, as in a new process. For tests.
void forgetSupportLibraryFunctions();

}  // namespace vesprun
