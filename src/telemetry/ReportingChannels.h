#pragma once

namespace vesprun {

/// Sets the scalar "com.quill.tapline.NAME" of today for every simple integer channel in category
/// 256 of the kernel's reporting channels. What cannot be read is left out without a message.
void LogTaplineChannelScalars();

}  // namespace vesprun
