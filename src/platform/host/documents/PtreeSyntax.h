#pragma once

#include <cstddef>
#include <optional>
#include <string>
#include <string_view>

namespace vesprun {

enum class PtreeElement { Dict, Array, Key, String, Integer, Real, True, False, Data, Date };

/// Nothing for a name that is no element of a ptree document; "ptree" itself is not among them.
std::optional<PtreeElement> ptreeElement(std::string_view name);

/// Where and why a document is refused.
struct PtreeFault {
  std::size_t offset = 0;  ///< in bytes from the start of the document
  std::string message;
};

/// Goes once through a document's bytes and checks everything that an XML parser would have to be
/// trusted with: UTF-8 and XML characters, references, tags and their attributes, element names,
/// nesting, and that keys and values take turns in a dictionary. What follows XML's rules but has
/// no place in a ptree document (DOCTYPE, CDATA, comments, processing instructions) is refused
/// here. Takes no memory and stops at the first fault, so that a large document that is none costs
/// little.
///
/// Whether the text of a number, a date or data is one is left to the reader. The start of the root
/// element, behind the byte order mark and the XML declaration, or nothing with `fault` set.
std::optional<std::size_t> checkPtreeSyntax(std::string_view document, PtreeFault& fault);

}  // namespace vesprun
