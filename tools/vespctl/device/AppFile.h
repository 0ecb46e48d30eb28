#pragma once

#include <optional>
#include <string>
#include <string_view>

#include "common/PropertyValue.h"

namespace vesprun {

/// The "app_data" of a message from a JSON array of app dictionaries: "bundle_id" and "version"
/// (strings), "adam_id" and "arch" (integers), "uuid" (text of 8-4-4-4-12 hexadecimal digits, in
/// either case). An entry that is absent is left out of the message too. Nothing, with a text in
/// `error` that names the place ("app 2: \"uuid\": ..."), for anything else.
std::optional<PropertyArray> appDataFromJson(std::string_view json, std::string& error);

}  // namespace vesprun
