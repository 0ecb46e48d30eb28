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

// The entry points of vesprun for other programs: the storage controller's statistics as
// dictionaries, and the analytics events made of them.
//
// A program opens one `Device` and calls the operations from one thread. None of them throws: what
// fails leaves its text with `GetAPIErrorMessage`. Without an open device, or when memory runs out,
// an operation returns its empty result: an empty dictionary, nothing, or false. Dictionaries that
// are returned belong to the caller.
//
// Every operation closes the connection that it opened to the storage controller and releases its
// registry handles before it returns, but for `openORUConnection`.
//
// Values are header-only; a program is built with the same C++ library and the same version of
// tsl::ordered_map as the shared library.
