#pragma once

#include "page/DeviceKeys.h"
#include "page/Document.h"
#include "page/KeyTable.h"
#include "page/Page.h"

namespace vesprun {

// The parts of a device's page below the first screen.

void addReports(Document& document, const PageData& data, const PageDays& days);
void addStorage(Document& document, const PageData& data);
void addKeys(Document& document, const PageData& data, const PageDays& days,
             const KeyChanges& changes, const KeyTable& table);
void addEvents(Document& document, const PageData& data);
void addOthers(Document& document, const PageData& data);
/// The lines of level error in the system log.
void addErrors(Document& document, const PageData& data);
void addKeptBack(Document& document, const std::vector<KeptBack>& keptBack, const KeyTable& table);

}  // namespace vesprun
