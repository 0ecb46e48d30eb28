#pragma once

namespace vesprun {

/// Does the storage controller recommend deleting content? False when it cannot be asked: most
/// controllers have no such method, and are not opened. Other failures are lines on the standard
/// error stream.
bool NandRecommendsContentDeletion();

}  // namespace vesprun
