#include "platform/host/documents/PtreeReader.h"

#include <algorithm>
#include <charconv>
#include <cstdint>
#include <pugixml.hpp>
#include <utility>

#include "common/Calendar.h"
#include "platform/host/documents/Base64.h"
#include "platform/host/documents/PtreeSyntax.h"
#include "platform/host/documents/QuotedText.h"
#include "platform/host/documents/RealText.h"

namespace vesprun {
namespace {

std::optional<Number> parseInteger(std::string_view text) {
  const char* end = text.data() + text.size();
  std::int64_t integer = 0;
  if (const auto [stop, failure] = std::from_chars(text.data(), end, integer);
      failure == std::errc() && stop == end) {
    return Number(integer);
  }
  std::uint64_t large = 0;
  if (const auto [stop, failure] = std::from_chars(text.data(), end, large);
      failure == std::errc() && stop == end) {
    return Number(large);
  }
  return std::nullopt;
}

/// Turns the elements, whose syntax has been checked, into values. Offsets count from the root
/// element.
class TreeReader {
 public:
  explicit TreeReader(PtreeFault& fault) : _fault(fault) {}

  // Recursion is as deep as the containers are, which the syntax check has limited.
  std::optional<PropertyValue> value(const pugi::xml_node& node) {
    const std::string_view text = node.value();
    const std::optional<PtreeElement> element = ptreeElement(node.name());
    switch (element.value_or(PtreeElement::Key)) {
      case PtreeElement::Dict:
        return dict(node);
      case PtreeElement::Array:
        return array(node);
      case PtreeElement::String:
        return PropertyValue(text);
      case PtreeElement::Integer:
        return scalar(node, parseInteger(text), "is no integer of 64 bits");
      case PtreeElement::Real:
        return scalar(node, parseReal(text), "is no real number that a double can hold");
      case PtreeElement::True:
      case PtreeElement::False:
        return text.empty() ? std::optional(PropertyValue(*element == PtreeElement::True))
                            : fault(node, '<' + std::string(node.name()) + "> is not empty");
      case PtreeElement::Data:
        return scalar(node, parseBase64(text), "is not base64");
      case PtreeElement::Date:
        return scalar(node, parseDateText(text), "is not a date");
      case PtreeElement::Key:
        break;
    }
    return fault(node, "not a value");
  }

 private:
  std::optional<PropertyValue> fault(const pugi::xml_node& node, std::string message) {
    _fault = {static_cast<std::size_t>(std::max<std::ptrdiff_t>(node.offset_debug(), 0)),
              std::move(message)};
    return std::nullopt;
  }

  template <typename T>
  std::optional<PropertyValue> scalar(const pugi::xml_node& node, std::optional<T> parsed,
                                      const char* complaint) {
    return parsed ? std::optional(PropertyValue(*std::move(parsed)))
                  : fault(node, quotedText(node.value()) + ' ' + complaint);
  }

  std::optional<PropertyValue> dict(const pugi::xml_node& node) {
    PropertyDict dict;
    for (pugi::xml_node key = elementFrom(node.first_child()); key;) {
      const pugi::xml_node entry = elementFrom(key.next_sibling());
      std::optional<PropertyValue> read = value(entry);
      if (!read) {
        return std::nullopt;
      }
      dict.set(key.value(), *std::move(read));
      key = elementFrom(entry.next_sibling());
    }
    return dict;
  }

  std::optional<PropertyValue> array(const pugi::xml_node& node) {
    PropertyArray array;
    for (pugi::xml_node element = elementFrom(node.first_child()); element;
         element = elementFrom(element.next_sibling())) {
      std::optional<PropertyValue> read = value(element);
      if (!read) {
        return std::nullopt;
      }
      array.push_back(*std::move(read));
    }
    return array;
  }

  /// The node, or the next one that is an element: what lies between is white space.
  static pugi::xml_node elementFrom(pugi::xml_node node) {
    while (node && node.type() != pugi::node_element) {
      node = node.next_sibling();
    }
    return node;
  }

  PtreeFault& _fault;
};

std::string lineMessage(std::string_view document, const PtreeFault& fault) {
  const std::string_view before = document.substr(0, fault.offset);
  const auto line = 1 + std::count(before.begin(), before.end(), '\n');
  return "line " + std::to_string(line) + ": " + fault.message;
}

}  // namespace

std::optional<PropertyValue> readPtree(std::string_view bytes, std::string& error) {
  PtreeFault fault;
  const std::optional<std::size_t> rootStart = checkPtreeSyntax(bytes, fault);
  if (!rootStart) {
    error = lineMessage(bytes, fault);
    return std::nullopt;
  }
  const std::string_view body = bytes.substr(*rootStart);
  // White space is a text only where an element holds nothing else. A text is kept in its element,
  // which saves a node for each.
  constexpr unsigned kOptions = pugi::parse_escapes | pugi::parse_eol |
                                pugi::parse_ws_pcdata_single | pugi::parse_embed_pcdata;
  pugi::xml_document document;
  const pugi::xml_parse_result result =
      document.load_buffer(body.data(), body.size(), kOptions, pugi::encoding_utf8);
  std::optional<PropertyValue> value;
  if (result) {
    const pugi::xml_node root = document.child("ptree");
    const pugi::xml_node first = root.find_child(
        [](const pugi::xml_node& child) { return child.type() == pugi::node_element; });
    fault = {static_cast<std::size_t>(std::max<std::ptrdiff_t>(root.offset_debug(), 0)),
             "a document without a value"};
    value = first ? TreeReader(fault).value(first) : std::nullopt;
  } else {
    fault = {static_cast<std::size_t>(std::max<std::ptrdiff_t>(result.offset, 0)),
             result.description()};
  }
  if (!value) {
    fault.offset += *rootStart;
    error = lineMessage(bytes, fault);
  }
  return value;
}

}  // namespace vesprun
