#pragma once

#include <optional>
#include <string>
#include <string_view>

#include "common/PropertyValue.h"

namespace vesprun {

/// "app_data" from a JSON array of app dictionaries: "bundle_id" and "version" (strings), "adam_id"
/// and "arch" (integers), "uuid" (8-4-4-4-12 hexadecimal digits in either case). Absent entries
/// stay absent. Nothing, with the place in `error` ("app 2: \"uuid\": ..."), for anything else.
std::optional<PropertyArray> appDataFromJson(std::string_view json, std::string& error);

}  // namespace vesprun
