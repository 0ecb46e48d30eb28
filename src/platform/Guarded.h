#pragma once

#include <exception>
#include <string>

#include "platform/Platform.h"

namespace vesprun {

/// Runs `work` and logs what it throws as "WHAT: ...": for destructors and threads, where an
/// exception would end the process.
template <typename Work>
void runGuarded(SystemLog& log, const char* what, const Work& work) noexcept {
  try {
    try {
      work();
    } catch (const std::exception& failure) {
      log.write(LogLevel::Error, std::string(what) + ": " + failure.what());
    }
  } catch (...) {  // not even the log can be written
  }
}

/// For work that must continue even when an allocation fails.
template <typename Step>
void runGuarded(const Step& step) noexcept {
  runGuarded(platform().systemLog(), "unexpected failure", step);
}

}  // namespace vesprun
