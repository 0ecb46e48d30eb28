#pragma once

#include <optional>
#include <string>
#include <string_view>

#include "common/PropertyDict.h"

namespace vesprun {

/// The platform's serialized form of a `PropertyValue` tree: ptree documents in XML form.
class PtreeSerialization {
 public:
  virtual ~PtreeSerialization() = default;

  /// The value of a document. Nothing when the bytes are not one; `error` then says why and names
  /// the line.
  virtual std::optional<PropertyValue> parse(std::string_view bytes, std::string& error) = 0;

  /// The document of a dictionary. Nothing when it holds a string that XML cannot carry; `error`
  /// then names it.
  virtual std::optional<std::string> serialize(const PropertyDict& dict, std::string& error) = 0;
};

}  // namespace vesprun
