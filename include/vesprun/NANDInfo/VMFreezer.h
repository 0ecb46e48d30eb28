#pragma once

#include "../Export.h"
#include "../common/PropertyDict.h"

namespace vesprun {

/// The bytes that the kernel's swap-out thread has written, from a kernel snapshot: the same
/// unsigned 64-bit number as "HLT_VMFreezer_bytesWritten" and
/// "com.quill.NANDInfo.VMFreezer.NumPhysicalWrites", 0 when the thread has no such counter. Empty
/// when there is no snapshot, or no such thread in it.
VESPRUN_EXPORT PropertyDict CopyVMFreezerNANDInfo() noexcept;

}  // namespace vesprun
