#pragma once

#include <string>

#include "platform/PtreeSerialization.h"
#include "vesprun/PropertyValue.h"

namespace vesprun {

/// Appends the ptree document of a value: UTF-8, one tab for each level, entries in order.
/// `readPtree` reads back an equal value, without the widths of integers and floats.
///
/// False when the document cannot carry the value: a key or string that is not UTF-8 or holds a
/// character that XML 1.0 excludes, a date beyond the years of date texts, or more than 200 nested
/// containers. `error` then names the place ("\"outer\" > [2] > \"name\": ..."), and `document` is
/// unchanged.
bool writePtree(const PropertyValue& value, std::string& document, std::string& error);
bool writePtree(const PropertyDict& dict, std::string& document, std::string& error);

/// Like these, but in two steps, and the text goes to `sink` piece by piece.
bool isPtree(const PtreeDocument& document, std::string& error);
void writePtree(const PtreeDocument& document, const PtreeSerialization::Sink& sink);

}  // namespace vesprun
