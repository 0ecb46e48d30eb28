#pragma once

#include <exception>
#include <nlohmann/json_fwd.hpp>
#include <optional>
#include <string>
#include <string_view>

namespace vesprun {

/// A JSON text of which every word counts: nothing, with a text in `error` that names the place,
/// when it is no JSON, when an object repeats a name or an integer does not fit 64 bits.
std::optional<nlohmann::ordered_json> parseStrictJson(std::string_view text, std::string& error);

/// What is wrong and where (line, column), without the library's own prefix.
std::string parseErrorText(const std::exception& exception);

}  // namespace vesprun
