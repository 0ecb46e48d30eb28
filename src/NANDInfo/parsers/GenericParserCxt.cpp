#include "NANDInfo/parsers/GenericParserCxt.h"

#include <algorithm>
#include <array>
#include <charconv>
#include <limits>
#include <new>

#include "common/LittleEndian.h"

namespace vesprun {

void GenericParserCxt::reserve(std::size_t count) noexcept {
  try {
    _values.reserve(_values.size() + count);
  } catch (const std::bad_alloc&) {
    // Appending then fails when memory runs out.
  }
}

bool GenericParserCxt::append(std::string_view prefix, std::string_view suffix,
                              std::uint64_t value) noexcept {
  const std::size_t begin = _names.size();
  const std::size_t fields = _values.size();
  prefix = prefix.substr(0, kMaxNameLength);
  suffix = suffix.substr(0, kMaxNameLength - prefix.size());
  try {
    if (begin > std::numeric_limits<std::uint32_t>::max()) {
      throw std::bad_alloc();
    }
    _names.append(prefix).append(suffix);
    _values.push_back(value);
    _runs.push_back({KnownNames(), static_cast<std::uint32_t>(_names.size() - begin),
                     static_cast<std::uint32_t>(begin)});
    return true;
  } catch (const std::bad_alloc&) {
    _names.resize(begin);
    _values.resize(fields);
    return false;
  }
}

bool GenericParserCxt::appendKnown(KnownNames names, const std::uint8_t* source, std::size_t width,
                                   std::size_t count) noexcept {
  try {
    Run& run = _runs.emplace_back(Run{names, 0, 0});
    for (; run.size < count; ++run.size) {
      const std::uint8_t* const element = source + run.size * width;
      // The usual widths as constants: each is one load.
      _values.push_back(width == sizeof(std::uint64_t)   ? loadLittleEndian<std::uint64_t>(element)
                        : width == sizeof(std::uint32_t) ? loadLittleEndian<std::uint32_t>(element)
                                                         : loadLittleEndian(element, width));
    }
    return true;
  } catch (const std::bad_alloc&) {
    return false;
  }
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
  if (count == 1) {
    return AddSingleValueToGenericContext(ctx, "", name, loadLittleEndian(source, width));
  }
  bool allAppended = true;
  for (std::uint32_t i = 0; i < count; ++i) {
    std::array<char, std::numeric_limits<std::uint32_t>::digits10 + 1> digits;
    const char* const end = std::to_chars(digits.data(), digits.data() + digits.size(), i).ptr;
    allAppended = AddSingleValueToGenericContext(ctx, name, {digits.data(), end},
                                                 loadLittleEndian(source + i * width, width)) &&
                  allAppended;
  }
  return allAppended;
}

void ReleaseGenericParserCxt(GenericParserCxt& ctx) { ctx.release(); }

PropertyDict CreateDictFromCxt(const GenericParserCxt& ctx, const FieldTable* filter) {
  PropertyDict dict;
  dict.reserve(filter != nullptr ? std::min(ctx.size(), filter->size()) : ctx.size());
  ctx.forEach([&](const GenericParserCxt::Field& field) {
    if (filter == nullptr || field.in(*filter) != nullptr) {
      dict.set(field.name, field.value);
    }
  });
  return dict;
}

}  // namespace vesprun
