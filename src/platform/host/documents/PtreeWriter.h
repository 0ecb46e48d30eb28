#pragma once

#include <string>

#include "common/PropertyValue.h"

namespace vesprun {

/// Appends the ptree document of a value to `document`: UTF-8, one tab for each level, entries in
/// their order. `readPtree` reads back an equal value, except that it cannot tell the widths of
/// integers; a single-precision float is written with the digits of the double of equal value.
///
/// False when the document could not carry the value: a key or string that is not UTF-8 or holds
/// a character that XML 1.0 excludes, a date outside the years that date texts can have, or
/// containers nested deeper than 200. `error` then names the place by its keys and array indices
/// ("\"outer\" > [2] > \"name\": ...", eight of them at most), and `document` is what it was.
bool writePtree(const PropertyValue& value, std::string& document, std::string& error);
bool writePtree(const PropertyDict& dict, std::string& document, std::string& error);

}  // namespace vesprun
