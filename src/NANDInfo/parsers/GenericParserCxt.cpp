#include "NANDInfo/parsers/GenericParserCxt.h"

#include <array>
#include <charconv>
#include <limits>
#include <new>

#include "common/LittleEndian.h"

namespace vesprun {

bool GenericParserCxt::append(std::string_view prefix, std::string_view suffix,
                              std::uint64_t value) noexcept {
  const std::size_t begin = _names.size();
  prefix = prefix.substr(0, kMaxNameLength);
  try {
    _names.append(prefix).append(suffix.substr(0, kMaxNameLength - prefix.size()));
    _entries.push_back({_names.size(), value});
    return true;
  } catch (const std::bad_alloc&) {
    _names.resize(begin);
    return false;
  }
}

bool GenericParserCxt::appendArray(std::string_view name, const std::uint8_t* source,
                                   std::size_t width, std::size_t count) noexcept {
  std::array<char, std::numeric_limits<std::size_t>::digits10 + 1> digits;
  bool allAppended = true;
  for (std::size_t i = 0; i < count; ++i) {
    const char* const end = std::to_chars(digits.data(), digits.data() + digits.size(), i).ptr;
    const std::uint64_t value = loadLittleEndian(source + i * width, width);
    allAppended = append(name, {digits.data(), end}, value) && allAppended;
  }
  return allAppended;
}

bool AddSingleValueToGenericContext(GenericParserCxt& ctx, std::string_view prefix,
                                    std::string_view suffix, std::uint64_t value) {
  return ctx.append(prefix, suffix, value);
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
  return count == 1 ? AddSingleValueToGenericContext(ctx, "", name, loadLittleEndian(source, width))
                    : ctx.appendArray(name, source, width, count);
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
