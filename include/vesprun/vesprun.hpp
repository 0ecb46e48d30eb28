#pragma once

#include "Device.h"
#include "NANDInfo/APIErrorMessage.h"
#include "NANDInfo/ContentDeletion.h"
#include "NANDInfo/CopyNANDInfo.h"
#include "NANDInfo/EventExtraction.h"
#include "NANDInfo/HealthSets.h"
#include "NANDInfo/Magazine.h"
#include "NANDInfo/ORUConnection.h"
#include "NANDInfo/StructuredLogState.h"
#include "NANDInfo/VMFreezer.h"
#include "NANDInfo/WhitelistedFieldSets.h"

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
