#pragma once

#include <string>
#include <string_view>

namespace vesprun {

/// Somebody's text for a terminal: "\xNN" for every byte of a control character and every byte
/// that is not UTF-8. It is one line.
std::string printableText(std::string_view text);

/// The same for a message: in double quotes, cut after 40 characters.
std::string quotedText(std::string_view text);

}  // namespace vesprun
