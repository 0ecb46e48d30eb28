#pragma once

#include "page/DeviceKeys.h"
#include "page/Document.h"
#include "page/Page.h"

namespace vesprun {

/// The first screen: whose page it is, and what changed.
void addOverview(Document& document, const PageAbout& about, const PageData& data,
                 const PageDays& days, KeyChanges& changes);

}  // namespace vesprun
