#pragma once

namespace vesprun {

/// Opens "/dev/null" for each standard stream that the process was started without. A file that was
/// opened in its place would take what is printed. To be called before anything is opened.
void openStandardStreams();

}  // namespace vesprun
