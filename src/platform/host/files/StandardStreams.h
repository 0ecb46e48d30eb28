#pragma once

#include "platform/SystemLog.h"

namespace vesprun {

/// Occupies each standard stream that is closed, so that no file of the device gets its number and
/// all that is printed. A limit on the size of files is an error of writing from then on, and ends
/// no process. Using the stream still fails. Call before anything is opened.
void holdStandardStreams();

/// What begins a line on standard error where that is the system's journal, which takes it as the
/// line's level: "<3>" for an error. Empty elsewhere.
const char* journalLevel(LogLevel level);

/// When memory runs out where no exception may leave, such as in a destructor, or for the exception
/// itself, the process ends with `status` and a line on standard error. `program` must live on.
void exitWithoutMemory(const char* program, int status);

}  // namespace vesprun
