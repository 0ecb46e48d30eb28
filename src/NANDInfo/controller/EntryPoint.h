#pragma once

#include <exception>
#include <type_traits>

#include "NANDInfo/parsers/APIErrorMessage.h"
#include "platform/Platform.h"

namespace vesprun {

/// Runs an operation that other programs call. Without an open device, or when the body throws (out
/// of memory), the error is recorded and the result is empty.
template <typename Body>
std::invoke_result_t<Body&> runEntryPoint(const char* operation, Body body) noexcept {
  if (!platformIsInstalled()) {
    SetAPIErrorMessage("%s: no device is open", operation);
    return std::invoke_result_t<Body&>();
  }
  try {
    return body();
  } catch (const std::exception& failure) {
    SetAPIErrorMessage("%s: %s", operation, failure.what());
    return std::invoke_result_t<Body&>();
  }
}

}  // namespace vesprun
