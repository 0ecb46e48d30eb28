#pragma once

#include "APIErrorMessage.h"
#include "ContentDeletion.h"
#include "CopyNANDInfo.h"
#include "Device.h"
#include "EventExtraction.h"
#include "HealthSets.h"
#include "Magazine.h"
#include "ORUConnection.h"
#include "StructuredLogState.h"
#include "VMFreezer.h"
#include "WhitelistedFieldSets.h"

// Entry points for other programs: the storage controller's statistics as dictionaries, and the
// analytics events made of them.
//
// Open one `Device` and call from one thread. Nothing throws: failures leave their text with
// `GetAPIErrorMessage`. Without an open device, or when memory runs out, the result is empty: an
// empty dictionary, nothing, or false. The caller owns returned dictionaries.
//
// Every operation closes its connection to the storage controller and releases its registry handles
// before it returns, except `openORUConnection`.
//
// Values are types of the C++ library: build with the same one as the shared library.
