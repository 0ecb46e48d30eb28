#pragma once

#include <utility>

#include "platform/DeviceRegistry.h"
#include "platform/Platform.h"

namespace vesprun {

/// Owns a handle and returns it to the installed platform's registry.
class RegistryObject {
 public:
  explicit RegistryObject(RegistryHandle handle = 0) : _handle(handle) {}
  RegistryObject(RegistryObject&& other) noexcept : _handle(other.take()) {}
  RegistryObject& operator=(RegistryObject&& other) noexcept {
    std::swap(_handle, other._handle);
    return *this;
  }
  ~RegistryObject() {
    if (_handle != 0) {
      platform().deviceRegistry().DevRegObjectRelease(_handle);
    }
  }

  explicit operator bool() const { return _handle != 0; }
  RegistryHandle get() const { return _handle; }
  /// Passes the handle to a caller who returns it.
  RegistryHandle take() { return std::exchange(_handle, 0); }

 private:
  RegistryHandle _handle;
};

}  // namespace vesprun
