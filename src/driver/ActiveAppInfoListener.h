#pragma once

#include "platform/MessageService.h"

namespace vesprun {

/// True from the moment a client notified the logging status until the app info that this asks for
/// has been served.
extern bool aaiRequested;

/// Directs a new peer's messages to `handlePeerMessage` and starts it.
void handleNewPeer(PeerConnection& peer);

/// Acts on one message, a dictionary; any other value is ignored. The low 32 bits of "operation"
/// decide:
///
/// - 2: the active apps, in "app_data". Requested, the day check runs with them; else they are
///   logged and dropped.
/// - 0: the logging status. Requests the app info and posts a notification.
/// - 1: the daily tasks for the day in the low 32 bits of "value".
///
/// Of all messages with another operation than 2 only the first in the life of the process counts.
void handlePeerMessage(const PropertyValue& message);

}  // namespace vesprun
