#pragma once

#include <string_view>

#include "NANDInfo/APIErrorMessage.h"

namespace vesprun {

/// Sets of fields carry the first error text of the process under this key.
inline constexpr std::string_view kAPIErrorMessageKey = "HLT_APIErrorMessage";
/// What cannot be had at all is a dictionary with the reason under this key.
inline constexpr std::string_view kNANDInfoErrorMessageKey = "com.quill.NANDInfo.ErrorMessage";

/// Records the first error text of the process, formatted in the manner of printf and cut to 1023
/// bytes. By convention it begins with the name of the operation that failed. Once a text has been
/// recorded, even an empty one, further calls do nothing and do not look at their arguments.
[[gnu::format(printf, 1, 2)]] void SetAPIErrorMessage(const char* format, ...) noexcept;

}  // namespace vesprun
