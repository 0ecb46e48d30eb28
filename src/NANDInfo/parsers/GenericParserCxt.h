#pragma once

#include <cstddef>
#include <cstdint>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "NANDInfo/tables/FieldTable.h"
#include "NANDInfo/tables/KnownNames.h"
#include "vesprun/PropertyDict.h"

namespace vesprun {

/// The result of the statistics parsers: an ordered list of named unsigned 64-bit fields, possibly
/// with repeated names. No field needs an allocation of its own: the names of known statistics are
/// constants, and all other names share one text.
class GenericParserCxt {
 public:
  static constexpr std::size_t kMaxNameLength = 98;  ///< longer names are cut

  struct Field {
    std::string_view name;  ///< valid until the context is changed
    std::uint64_t value;
    std::optional<std::uint16_t> row;  ///< `rowOfField` of a known name

    /// Its range in a table, or null.
    const FieldRange* in(const FieldTable& table) const {
      return row && table.isMadeOfRows() ? table.findRow(*row) : table.find(name);
    }
  };

  std::size_t size() const { return _values.size(); }
  bool empty() const { return _values.empty(); }

  /// Calls `visit(field)` for each, in the order in which they were appended.
  template <typename Visit>
  void forEach(Visit&& visit) const {
    const std::uint64_t* value = _values.data();
    for (const Run& run : _runs) {
      if (!run.names.isKnown()) {
        visit(Field{std::string_view(_names).substr(run.begin, run.size), *value++, {}});
        continue;
      }
      for (std::size_t i = 0; i < run.size; ++i) {
        visit(Field{run.names.text(i), *value++, run.names.row(i)});
      }
    }
  }

  /// Makes room for that many more values, if there is memory.
  void reserve(std::size_t count) noexcept;
  /// See `AddSingleValueToGenericContext`.
  bool append(std::string_view prefix, std::string_view suffix, std::uint64_t value) noexcept;
  /// Appends `count` fields under these names: the little-endian values of `width` bytes, 1 to 8,
  /// at `source`. False when memory runs out; fields are then missing.
  bool appendKnown(KnownNames names, const std::uint8_t* source, std::size_t width,
                   std::size_t count) noexcept;
  /// Empties the context and frees its memory.
  void release() { *this = GenericParserCxt(); }

 private:
  /// Elements of a known statistic, or one field of another name, which lies in `_names`.
  struct Run {
    KnownNames names;
    std::uint32_t size;   ///< the number of elements, or the length of the other name
    std::uint32_t begin;  ///< of the other name
  };

  std::string _names;
  std::vector<Run> _runs;
  std::vector<std::uint64_t> _values;  ///< of all fields
};

/// Appends a field named `prefix` + `suffix`, cut to `kMaxNameLength` characters. False, and
/// nothing appended, when memory runs out.
bool AddSingleValueToGenericContext(GenericParserCxt& ctx, std::string_view prefix,
                                    std::string_view suffix, std::uint64_t value);

inline constexpr std::uint32_t kMaxFieldsOfOneCall = 65'535;

/// Appends the `count` little-endian elements of `width` bytes at `source`, at any address. A
/// single element is named `name`, several `name` + index from 0.
///
/// True, and nothing appended, when `width` or `count` is 0. False, and nothing appended, when
/// `width` is above 8, or `count` above `kMaxFieldsOfOneCall`: a truncated array would look
/// like a complete one. False also when memory runs out; elements are then missing.
bool AddMultipleFieldsToGenericContext(GenericParserCxt& ctx, std::string_view name,
                                       const std::uint8_t* source, std::uint32_t width,
                                       std::uint32_t count);

/// Empties the context for further use.
void ReleaseGenericParserCxt(GenericParserCxt& ctx);

/// The fields, of which only those that `filter` lists when it is given, as a dictionary of
/// unsigned 64-bit numbers. A repeated name keeps its first place and its last value.
PropertyDict CreateDictFromCxt(const GenericParserCxt& ctx, const FieldTable* filter = nullptr);

}  // namespace vesprun
