#pragma once

#include <array>
#include <cstdint>
#include <functional>
#include <optional>
#include <string>
#include <string_view>

#include "vesprun/PropertyDict.h"

namespace vesprun {

/// A dictionary with one more entry at the end: an array of dictionaries that are made one at a
/// time, since all of them together may need much memory.
struct PtreeDocument {
  const PropertyDict& entries;
  std::string_view lastKey = {};
  /// Calls `take` with each element until it returns false. Null: the document has no such array.
  std::function<void(const std::function<bool(const PropertyDict& element)>& take)> lastArray = {};
};

/// Values as ptree documents in XML form.
class PtreeSerialization {
 public:
  /// Takes a piece of a document.
  using Sink = std::function<void(std::string_view piece)>;

  virtual ~PtreeSerialization() = default;

  /// Nothing, with the line and the reason in `error`, when the bytes are not a document.
  virtual std::optional<PropertyValue> parse(std::string_view bytes, std::string& error) = 0;

  /// False, with the place in `error`, when the dictionary holds a string that XML cannot carry.
  virtual bool canSerialize(const PtreeDocument& document, std::string& error) = 0;

  /// Hands the text of a document that can be serialized to `sink`, in one piece
  /// when it has at most 1 MiB, else in pieces of about that size.
  virtual void serialize(const PtreeDocument& document, const Sink& sink) = 0;

  /// The MD5 digest (RFC 1321) of a document or any other bytes.
  virtual std::array<std::uint8_t, 16> md5(std::string_view bytes) = 0;
};

}  // namespace vesprun
