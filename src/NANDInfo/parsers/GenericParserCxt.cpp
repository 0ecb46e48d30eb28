#include "NANDInfo/parsers/GenericParserCxt.h"

#include <algorithm>
#include <charconv>
#include <limits>

#include "common/LittleEndian.h"

namespace vesprun {

void GenericParserCxt::appendArray(std::string_view name, const std::uint8_t* source,
                                   std::size_t width, std::size_t count) {
  // A buffer has thousands of elements: room for all names of the array is made at once, and each
  // is written where it stays.
  constexpr std::size_t kMostDigits = std::numeric_limits<std::size_t>::digits10 + 1;
  name = name.substr(0, kMaxNameLength);
  std::size_t at = _names.size();
  _names.resize(at + count * std::min(name.size() + kMostDigits, kMaxNameLength) + kMostDigits);
  for (std::size_t i = 0; i < count; ++i) {
    char* const begin = _names.data() + at;
    char* const index = std::copy(name.begin(), name.end(), begin);
    const char* const end = std::to_chars(index, index + kMostDigits, i).ptr;
    at += std::min(static_cast<std::size_t>(end - begin), kMaxNameLength);
    const std::uint8_t* const element = source + i * width;
    _entries.push_back({at, width == sizeof(std::uint64_t)
                                ? loadLittleEndian<std::uint64_t>(element)
                                : loadLittleEndian(element, width)});
  }
  _names.resize(at);
}

bool AddSingleValueToGenericContext(GenericParserCxt& ctx, std::string_view prefix,
                                    std::string_view suffix, std::uint64_t value) {
  if (prefix.empty()) {
    ctx.append(suffix, value);
  } else {
    ctx.append(std::string(prefix).append(suffix), value);
  }
  return true;
}

bool AddMultipleFieldsToGenericContext(GenericParserCxt& ctx, std::string_view name,
                                       const std::uint8_t* source, std::uint32_t width,
                                       std::uint32_t count) {
  if (width == 0 || count == 0) {
    return true;
  }
  if (width > sizeof(std::uint64_t) || count > kMaxFieldsOfOneCall) {
    return false;
  }
  if (count == 1) {
    ctx.append(name, loadLittleEndian(source, width));
    return true;
  }
  ctx.appendArray(name, source, width, count);
  return true;
}

void ReleaseGenericParserCxt(GenericParserCxt& ctx) { ctx.release(); }

PropertyDict CreateDictFromCxt(const GenericParserCxt& ctx) {
  PropertyDict dict;
  dict.reserve(ctx.size());
  for (const GenericParserCxt::Field field : ctx) {
    dict.set(field.name, field.value);
  }
  return dict;
}

}  // namespace vesprun
