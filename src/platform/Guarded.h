#pragma once

#include <exception>

#include "platform/SystemLog.h"

namespace vesprun {

/// Runs a step and logs what it throws: the guard of a job that must go on whatever happens, such
/// as memory running out.
template <typename Step>
void runGuarded(Step step) noexcept {
  try {
    try {
      step();
    } catch (const std::exception& failure) {
      logMessage(LogLevel::Error, "unexpected failure: %s", failure.what());
    }
  } catch (...) {  // not even the log can be written
  }
}

}  // namespace vesprun
