#pragma once

#include <nlohmann/json.hpp>
#include <optional>
#include <string>
#include <string_view>

#include "vesprun/PropertyValue.h"

namespace vesprun {

using Json = nlohmann::ordered_json;

/// The JSON form of a value on one line, dictionaries in order. A double always has a fraction or
/// an exponent ("2.0"). Values that JSON lacks are objects with one entry:
///
/// - `{"real":"inf"}`, `{"real":"-inf"}`, `{"real":"nan"}`: a double or float that is not finite;
/// - `{"float":0.25}`: a single-precision float, in the fewest digits that read back to it;
/// - `{"data":"AQID"}`: bytes in base64;
/// - `{"date":"2024-03-05T09:15:02Z"}`: a date.
///
/// Bytes of a string that are not UTF-8 become U+FFFD.
std::string jsonText(const Json& json);

// Values are written without the library, whose objects allocate even when they are destroyed: the
// job must outlive memory that runs out.
std::string jsonText(const PropertyValue& value);
std::string jsonText(const PropertyDict& dict);
/// Appends the JSON form of a string.
void appendJsonText(std::string_view string, std::string& text);

/// What the library calls for a value that becomes JSON; so an initializer of `Json` may hold
/// values. What holds no others is read from the text above, the only form that is written.
void to_json(Json& json, const PropertyValue& value);
void to_json(Json& json, const PropertyDict& dict);
void to_json(Json& json, const Number& number);

/// The value, or null.
template <typename T>
Json jsonOrNull(const std::optional<T>& value) {
  return value ? Json(*value) : Json();
}

/// Reads the JSON form. Nothing, with the line or entry in `error`, for malformed JSON, a duplicate
/// name, an integer beyond 64 bits, a number beyond a double, more than 200 nested containers, a
/// null, and a tagged object with a wrong text.
///
/// Integers are signed 64-bit numbers if they fit, else unsigned. An object with one entry is
/// tagged only if the entry has the right type (a number for "float", a string for the others).
std::optional<PropertyValue> valueFromJsonText(std::string_view text, std::string& error);

/// The same in two steps, for a reader that decides itself which objects are dictionaries: in a
/// plain value each object is one, and null is empty data.
std::optional<PropertyValue> plainValueFromJsonText(std::string_view text, std::string& error);
std::optional<PropertyValue> valueFromPlain(PropertyValue plain, std::string& error);

}  // namespace vesprun
