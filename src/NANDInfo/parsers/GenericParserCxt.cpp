#include "NANDInfo/parsers/GenericParserCxt.h"

#include <algorithm>
#include <array>
#include <charconv>
#include <limits>
#include <new>

#include "common/LittleEndian.h"

namespace vesprun {
namespace {

constexpr std::size_t kMostDigits = std::numeric_limits<std::size_t>::digits10 + 1;

}  // namespace

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
  const std::size_t begin = _names.size();
  const std::size_t first = _entries.size();
  try {
    appendAtOnce(name.substr(0, kMaxNameLength), source, width, count);
    return true;
  } catch (const std::bad_alloc&) {
    _names.resize(begin);
    _entries.resize(first);
  }
  std::array<char, kMostDigits> digits;
  bool allAppended = true;
  for (std::size_t i = 0; i < count; ++i) {
    const char* const end = std::to_chars(digits.data(), digits.data() + digits.size(), i).ptr;
    const std::uint64_t value = loadLittleEndian(source + i * width, width);
    allAppended = append(name, {digits.data(), end}, value) && allAppended;
  }
  return allAppended;
}

void GenericParserCxt::appendAtOnce(std::string_view name, const std::uint8_t* source,
                                    std::size_t width, std::size_t count) {
  // A buffer has thousands of elements: room for all names of the array is made at once, and each
  // is written where it stays.
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
