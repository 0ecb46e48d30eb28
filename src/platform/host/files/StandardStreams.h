#pragma once

namespace vesprun {

/// Takes the place of each standard stream that the process was started without, so that no file of
/// the device gets it and with it all that is printed. Using the stream fails as if it were closed.
/// To be called before anything is opened.
void holdStandardStreams();

/// From now on, memory that runs out where no exception may leave, such as in a destructor, ends
/// the process with `status` and one line on standard error. `program` stays for ever.
void exitWithoutMemory(const char* program, int status);

}  // namespace vesprun
