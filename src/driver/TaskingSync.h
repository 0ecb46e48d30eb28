#pragma once

namespace vesprun {

/// Records a change of the OS build; when the scheduled tasking or the build is new, undoes the
/// earlier tasking and applies this one; announces the disabled log types as events.
///
/// A tasking is current when its identifier and its build equal the stored ones; a build missing on
/// both sides is equal. The log shows a missing value as "(null)".
///
/// Records are taken in order. Without "Value" the key is removed; a missing or non-text "Domain",
/// "User" or "Key", or a record that is not a dictionary, leads to an error line of the platform
/// and nothing else. A payload that is not an array is stored as it is and has no records.
///
/// The mobile user's domains are written before the program's own, which says what was applied: the
/// next run makes up for one that is killed in between.
void syncTaskingAndOSChange();

}  // namespace vesprun
