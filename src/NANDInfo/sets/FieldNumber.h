#pragma once

#include <string_view>

#include "common/PropertyDict.h"

namespace vesprun {

/// The number under `name`, or null when there is none. Valid until the dictionary is changed.
inline const Number* numberUnder(const PropertyDict& fields, std::string_view name) {
  const PropertyValue* value = fields.find(name);
  return value != nullptr ? value->number() : nullptr;
}

}  // namespace vesprun
