#pragma once

#include <cstdint>

#include "platform/RegistryObject.h"

namespace vesprun {

// Images stored by the controller's EAN service. Each is named by a four-character code, its first
// character in the most significant byte. A query opens the service and closes it; a failure is a
// line in the system log, at default level, and the answer 0.

/// The service and the connection to it, which is closed at its end.
struct EANConnection {
  RegistryObject service{};
  RegistryHandle connection = 0;

  ~EANConnection() {
    if (connection != 0) {
      platform().deviceRegistry().DevRegServiceClose(connection);
    }
  }
};

/// Looks the service up and opens it. False, with no connection, when that fails.
bool getEANConnection(EANConnection& ean);

/// The size of an image as the service reports it.
std::uint64_t GetEANImageSize(std::uint32_t code);

/// How often an image was updated.
std::uint64_t GetEANUpdateCount(std::uint32_t code);

}  // namespace vesprun
