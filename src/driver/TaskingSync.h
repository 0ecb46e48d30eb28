#pragma once

namespace vesprun {

/// Records a change of the OS build; when the scheduled tasking or the build is new (a build
/// missing on both sides is not), undoes the earlier tasking and applies this one; announces the
/// disabled log types as events.
///
/// Records are taken in order. Without "Value" the key is removed; a missing or non-text "Domain",
/// "User" or "Key", or a record that is not a dictionary, only leads to an error line. A payload
/// that is not an array is stored as it is and has no records.
void syncTaskingAndOSChange();

}  // namespace vesprun
