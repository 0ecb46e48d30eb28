#pragma once

#include <string_view>

#include "vesprun/APIErrorMessage.h"

namespace vesprun {

/// The first error text of the process in sets of fields.
inline constexpr std::string_view kAPIErrorMessageKey = "HLT_APIErrorMessage";
/// In a NAND info that cannot be had, beside the reason.
inline constexpr std::string_view kNANDInfoErrorKey = "com.quill.NANDInfo.Error";
/// The reason, in place of a result that cannot be had.
inline constexpr std::string_view kNANDInfoErrorMessageKey = "com.quill.NANDInfo.ErrorMessage";

/// Records the first error text of the process, printf-style and cut to 1023 bytes. By convention
/// it begins with the failed operation's name. Once there is a text, even an empty one, further
/// calls do nothing.
[[gnu::format(printf, 1, 2)]] void SetAPIErrorMessage(const char* format, ...) noexcept;

/// As in a new process: the next text is the first.
void ForgetAPIErrorMessage() noexcept;

}  // namespace vesprun
