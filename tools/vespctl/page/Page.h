#pragma once

#include <string>
#include <vector>

#include "page/PageData.h"
#include "preview/KeptBack.h"
#include "vesprun/Date.h"

namespace vesprun {

/// The whole HTML document. It needs nothing but itself: no file, no network, no script.
///
/// `device` is a name for people, `now` the device's time.
std::string pageText(const std::string& device, const Date& now, const PageData& data,
                     const std::vector<KeptBack>& keptBack);

/// The style sheet, from page.css.
std::string_view pageStyle();

}  // namespace vesprun
