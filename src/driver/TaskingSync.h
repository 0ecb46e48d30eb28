#pragma once

namespace vesprun {

/// Records a change of the OS build. When the scheduled tasking or the build is new, undoes the
/// earlier tasking and applies this one; a build that was and is missing is not new. Announces the
/// disabled log types as events.
///
/// Records are taken in order. Without "Value" the key is removed; a missing or non-text "Domain",
/// "User" or "Key", or a record that is not a dictionary, only leads to an error line. A payload
/// that is not an array is stored as it is and has no records.
void syncTaskingAndOSChange();

}  // namespace vesprun
