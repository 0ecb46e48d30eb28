#pragma once

#include <cstddef>
#include <functional>
#include <optional>
#include <span>
#include <string>
#include <string_view>

#include "vesprun/PropertyValue.h"

namespace vesprun {

/// In bytes: 256 MiB.
inline constexpr std::size_t kMaxPtreeSize = std::size_t{256} << 20;

/// Reads a ptree document in XML form. Nothing, with "line 12: ..." in `error`, when the bytes are
/// not one.
///
/// - UTF-8, with or without byte order mark and XML declaration. `<ptree version="1.0">` holds one
///   value, nested at most 200 deep.
/// - Comments are skipped. DOCTYPE, CDATA sections and processing instructions are refused.
/// - `integer`: decimal digits, with a minus or without, from −2^63 to 2^64−1; signed if it fits.
/// - `real`: a decimal number that a double can hold, "inf", "-inf" or "nan".
/// - `data`: base64, white space ignored. `date`: as `dateText` writes it.
/// - A repeated key keeps its first place and its last value.
/// - White space counts in keys and strings, is refused in numbers and dates, and is skipped
///   between elements. `true` and `false` are empty.
///
/// Document, value and reading together take less than eight times the document's size, measured
/// with the smallest elements.
std::optional<PropertyValue> readPtree(std::string_view bytes, std::string& error);

/// Gets an entry of a dictionary when its value is complete. `keys` lead from the root to it
/// through dictionaries alone, its own is the last and begins on `line`, counted from 1.
using PtreeEntryVisitor = std::function<void(std::span<const std::string_view> keys,
                                             std::size_t line, const PropertyValue& value)>;

/// The same, and `visit` gets each entry in the order of the document, an entry that a later one
/// with its key replaces as well. Also for input that later proves malformed.
std::optional<PropertyValue> readPtreeEntries(std::string_view bytes, std::string& error,
                                              const PtreeEntryVisitor& visit);

}  // namespace vesprun
