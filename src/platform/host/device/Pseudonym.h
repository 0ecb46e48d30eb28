#pragma once

#include <string>
#include <string_view>

namespace vesprun {

/// A constant name that does not hold the identifier: 32 hexadecimal digits of HMAC-SHA-256 keyed
/// with it. Another purpose gives another name, and neither leads to the other. A short identifier
/// can be guessed by trying.
std::string pseudonymOf(std::string_view identifier, std::string_view purpose);

}  // namespace vesprun
