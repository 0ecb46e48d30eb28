#pragma once

#include "common/PropertyDict.h"

namespace vesprun {

/// The bytes that the kernel's swap-out thread has written, as a kernel snapshot tells: the same
/// unsigned 64-bit number as "HLT_VMFreezer_bytesWritten" and
/// "com.quill.NANDInfo.VMFreezer.NumPhysicalWrites". It is 0 when the thread has no I/O statistics,
/// or too short ones to hold it. Empty when there is no snapshot, or no such thread in it.
PropertyDict CopyVMFreezerNANDInfo();

}  // namespace vesprun
