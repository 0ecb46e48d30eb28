#pragma once

#include <array>
#include <cstdint>
#include <optional>
#include <string>
#include <string_view>

#include "common/PropertyDict.h"

namespace vesprun {

/// Values as ptree documents in XML form.
class PtreeSerialization {
 public:
  virtual ~PtreeSerialization() = default;

  /// Nothing, with the line and the reason in `error`, when the bytes are not a document.
  virtual std::optional<PropertyValue> parse(std::string_view bytes, std::string& error) = 0;

  /// Nothing, with the place in `error`, when the dictionary holds a string that XML cannot carry.
  virtual std::optional<std::string> serialize(const PropertyDict& dict, std::string& error) = 0;

  /// The MD5 digest (RFC 1321) of a document or any other bytes.
  virtual std::array<std::uint8_t, 16> md5(std::string_view bytes) = 0;
};

}  // namespace vesprun
