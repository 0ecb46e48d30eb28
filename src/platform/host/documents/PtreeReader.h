#pragma once

#include <cstddef>
#include <functional>
#include <optional>
#include <span>
#include <string>
#include <string_view>

#include "common/PropertyValue.h"

namespace vesprun {

/// The longest ptree document that is read, in bytes: 256 MiB.
inline constexpr std::size_t kLongestPtree = std::size_t{256} << 20;

/// Reads a ptree document in its XML form. Nothing when the bytes are not one; `error` then says
/// why, beginning with the line ("line 12: ...").
///
/// - UTF-8 only, with or without byte order mark and XML declaration; `<ptree version="1.0">` holds
///   one value, dictionaries and arrays at most 200 deep.
/// - Comments are skipped wherever XML allows them. DOCTYPE, CDATA sections and processing
///   instructions are refused.
/// - `integer`: an optional minus and decimal digits, nothing else, from −2^63 to 2^64−1; a signed
///   64-bit number when it fits, else an unsigned one.
/// - `real`: a decimal number that a double can hold, "inf", "-inf" or "nan"; a double.
/// - `data`: base64, white space ignored. `date`: what `dateText` writes.
/// - A repeated key keeps its first place and its last value.
/// - White space counts in keys and strings, also where there is nothing else; in numbers and dates
///   it is refused, between elements it is skipped. `true` and `false` are empty.
///
/// The document, its value and the reading together take less than eight times the document's size;
/// measured with documents of the smallest elements.
std::optional<PropertyValue> readPtree(std::string_view bytes, std::string& error);

/// Gets an entry of a dictionary when its value is complete. `keys` lead from the root to it
/// through dictionaries alone, its own is the last.
using PtreeEntryVisitor =
    std::function<void(std::span<const std::string_view> keys, const PropertyValue& value)>;

/// The same, and `visit` gets each entry in the order of the document, an entry that a later one
/// with its key replaces as well. Also of a document that turns out to be none.
std::optional<PropertyValue> readPtreeEntries(std::string_view bytes, std::string& error,
                                              const PtreeEntryVisitor& visit);

}  // namespace vesprun
