#pragma once

#include <string>
#include <string_view>

namespace vesprun {

/// A piece of somebody's text for a message of one line: in double quotes, cut after some forty
/// characters, with "\xNN" for every byte that is no printable character.
std::string quotedText(std::string_view text);

}  // namespace vesprun
