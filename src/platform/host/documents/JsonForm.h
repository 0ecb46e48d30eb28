#pragma once

#include <optional>
#include <string>
#include <string_view>

#include "common/PropertyValue.h"

namespace vesprun {

/// The JSON form of a value. Dictionary (in order), array, string, boolean and integer are what
/// they are. A double always has a fraction or an exponent ("2.0"). What JSON has no form for is an
/// object with one entry:
///
/// - `{"real":"inf"}`, `{"real":"-inf"}`, `{"real":"nan"}`: a double, or a single-precision float,
///   that is no finite number;
/// - `{"float":0.25}`: a single-precision float, with the fewest digits that read back to it;
/// - `{"data":"AQID"}`: bytes, in base64;
/// - `{"date":"2024-03-05T09:15:02Z"}`: a date.
///
/// Bytes of a string that are not UTF-8 become U+FFFD. One line without white space and without an
/// end.
std::string jsonText(const PropertyValue& value);
std::string jsonText(const PropertyDict& dict);

/// Appends the JSON form of a string.
void appendJsonText(std::string_view string, std::string& text);

/// The value that a JSON text stands for. Nothing, with a text in `error` that names the line or
/// the entry, for what is no JSON, a name that an object has twice, an integer outside the 64-bit
/// range (signed or unsigned), any other number that no double can hold, containers nested deeper
/// than 200, a null, and one of the four objects whose text is not of its kind.
///
/// An integer is a signed 64-bit number when it fits, else an unsigned one. An object with one
/// entry is one of the four only when the entry is of the type that they have (a number for
/// "float", a string for the others); any other object is a dictionary.
std::optional<PropertyValue> valueFromJsonText(std::string_view text, std::string& error);

/// The same in two steps, for a reader that decides itself which objects are dictionaries. In a
/// plain value each object is a dictionary, and empty data stands for null.
std::optional<PropertyValue> plainValueFromJsonText(std::string_view text, std::string& error);
std::optional<PropertyValue> valueFromPlain(const PropertyValue& plain, std::string& error);

}  // namespace vesprun
