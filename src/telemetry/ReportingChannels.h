#pragma once

namespace vesprun {

/// Sets the scalar "com.quill.tapline.NAME" of today for every simple channel in category 256. What
/// cannot be read is silently left out.
void LogTaplineChannelScalars();

}  // namespace vesprun
