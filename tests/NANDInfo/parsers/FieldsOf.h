#pragma once

#include <cstdint>
#include <string>
#include <utility>
#include <vector>

#include "NANDInfo/parsers/GenericParserCxt.h"

namespace vesprun {

using Fields = std::vector<std::pair<std::string, std::uint64_t>>;

inline Fields fieldsOf(const GenericParserCxt& ctx) {
  Fields fields;
  ctx.forEach([&fields](const GenericParserCxt::Field& field) {
    fields.emplace_back(field.name, field.value);
  });
  return fields;
}

}  // namespace vesprun
