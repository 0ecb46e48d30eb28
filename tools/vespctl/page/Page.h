#pragma once

#include <string>
#include <vector>

#include "page/PageData.h"
#include "preview/KeptBack.h"
#include "status/Findings.h"
#include "vesprun/Date.h"

namespace vesprun {

/// What a page says of a device besides what it reported.
struct PageAbout {
  std::string title;               ///< the host's name unless another was given
  std::vector<std::string> names;  ///< system, build, model and pseudonym
  Date now;                        ///< the device's time
  std::vector<Finding> findings;
  std::vector<KeptBack> keptBack;  ///< not shown when the page is shared
  std::string firstReport;         ///< when there will be one, where there is none yet
  bool isShared = false;           ///< without what is for the device's owner alone
};

/// The whole HTML document.
std::string pageText(const PageAbout& about, const PageData& data);

}  // namespace vesprun
