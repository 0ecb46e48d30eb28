#pragma once

#include "Export.h"
#include "PropertyDict.h"

namespace vesprun {

/// The bytes written by the kernel's swap-out thread, from a kernel snapshot: one unsigned 64-bit
/// number as "HLT_VMFreezer_bytesWritten" and "com.quill.NANDInfo.VMFreezer.NumPhysicalWrites", 0
/// without that counter. Empty without the snapshot or the thread.
VESPRUN_EXPORT PropertyDict CopyVMFreezerNANDInfo() noexcept;

}  // namespace vesprun
