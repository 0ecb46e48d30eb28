#pragma once

#include <string>
#include <string_view>

namespace vesprun {

/// Untrusted text for a terminal, on one line: bytes of control characters and bytes that are not
/// UTF-8 become "\xNN".
std::string printableText(std::string_view text);

/// The same in double quotes, cut after 40 characters.
std::string quotedText(std::string_view text);

}  // namespace vesprun
