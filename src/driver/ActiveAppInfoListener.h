#pragma once

#include "vesprun/PropertyValue.h"

namespace vesprun {

/// True from a client's notification of the logging status until the requested app info is served.
extern bool aaiRequested;

/// Handles a message, a dictionary, by the low 32 bits of "operation"; ignores any other value.
/// Failures go to the system log.
///
/// - 2: the active apps in "app_data". If requested, the day check runs with them; else they are
///   logged and dropped.
/// - 0: requests the app info and posts a notification.
/// - 1: runs the daily tasks for the day in the low 32 bits of "value".
///
/// Of all messages but 2, only the first of the process counts.
void handlePeerMessage(const PropertyValue& message) noexcept;

}  // namespace vesprun
