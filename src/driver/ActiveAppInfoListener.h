#pragma once

#include "common/PropertyValue.h"

namespace vesprun {

/// True from a client's notification of the logging status until the requested app info is served.
extern bool aaiRequested;

/// Handles a message, a dictionary; ignores any other value. A failure goes to the system log. The
/// low 32 bits of "operation" decide:
///
/// - 2: the active apps in "app_data". If requested, the day check runs with them; else they are
///   logged and dropped.
/// - 0: the logging status. Requests the app info and posts a notification.
/// - 1: the daily tasks for the day in the low 32 bits of "value".
///
/// Of all messages but 2, only the first of the process counts.
void handlePeerMessage(const PropertyValue& message) noexcept;

}  // namespace vesprun
