#include "NANDInfo/sets/FilteredDict.h"

#include <algorithm>

#include "NANDInfo/sets/SignificantDigits.h"

namespace vesprun {

PropertyDict CreateFilteredDict(const PropertyDict& source, const FieldTable* keys) {
  return CreateFilteredDict_SigDig(source, keys, false);
}

PropertyDict CreateFilteredDict_SigDig(const PropertyDict& source, const FieldTable* digits,
                                       bool round) {
  if (digits == nullptr) {
    return source;
  }
  PropertyDict filtered;
  filtered.reserve(std::min(source.size(), digits->size()));
  for (const auto& [key, value] : source) {
    const FieldRange* field = digits->find(key);
    if (field == nullptr) {
      continue;
    }
    const Number* number = round ? value.number() : nullptr;
    if (number != nullptr) {
      filtered.set(key, roundSig(number->asUInt64(), field->digits));
    } else {
      filtered.set(key, value);
    }
  }
  return filtered;
}

}  // namespace vesprun
