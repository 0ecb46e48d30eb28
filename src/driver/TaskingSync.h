#pragma once

namespace vesprun {

/// Records a change of the OS build, applies the scheduled tasking when it or the build is new,
/// after undoing the one before it, and announces the disabled log types as events.
///
/// A tasking is current when its identifier and the build it was applied under equal the stored
/// ones as values; a build that is missing on both sides is the same. A value that is missing
/// stands in the log lines as "(null)".
///
/// The records of a payload are taken in their order, and what one lacks is missing in the call to
/// the platform too: without "Value" the key is removed; a "Domain", "User" or "Key" that is
/// missing or no text leads to an error line of the platform and to nothing else, as does a record
/// that is no dictionary. A payload that is no array is stored as it is and has no records.
///
/// The mobile user's domains are written before the program's own, which tells what was applied: a
/// run that is killed in between is made up for by the next.
void syncTaskingAndOSChange();

}  // namespace vesprun
