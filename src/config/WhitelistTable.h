#pragma once

#include <tsl/ordered_map.h>

#include <cstddef>
#include <cstdint>
#include <deque>
#include <optional>
#include <string>
#include <string_view>
#include <tuple>
#include <vector>

#include "common/KeyHash.h"
#include "config/KeyOptions.h"
#include "config/PrefixTable.h"
#include "config/WhitelistKeyGroup.h"
#include "vesprun/PropertyDict.h"

namespace vesprun {

/// What the whitelist says of a key or prefix; refers to the document.
template <typename Options>
struct WhitelistEntry {
  const std::string* group;      ///< the last one that names it
  const PropertyValue* written;  ///< its options as they stand there
  const Options* options;        ///< null when they cannot be read: held back
  std::uint32_t place;           ///< among the taken entries of all groups
  bool hasUnread;                ///< an option that nothing reads
};

enum class DecidedBy { Nothing, Key, Prefix, InternalDevice };

/// How the whitelist decides on a key.
template <typename Options>
struct WhitelistDecision {
  DecidedBy by = DecidedBy::Nothing;
  std::string_view prefix;                         ///< DecidedBy::Prefix
  const WhitelistEntry<Options>* entry = nullptr;  ///< DecidedBy::Key and Prefix

  /// The options that apply when the key leaves the device; null if it must not.
  const Options* options() const {
    static constexpr Options kNoOptions;
    if (by == DecidedBy::InternalDevice) {
      return &kNoOptions;
    }
    return entry != nullptr ? entry->options : nullptr;
  }

  /// The last enabled group that names the key or its prefix.
  std::optional<PropertyValue> group() const {
    return entry != nullptr ? std::optional<PropertyValue>(*entry->group) : std::nullopt;
  }

  /// The options as written in the whitelist; empty if they are not a dictionary.
  std::optional<PropertyValue> writtenOptions() const {
    if (by == DecidedBy::InternalDevice) {
      return PropertyDict();
    }
    return entry != nullptr && entry->written->dict() != nullptr ? std::optional(*entry->written)
                                                                 : std::nullopt;
  }
};

/// The keys and prefixes of one kind, scalars or distributions, from the enabled groups.
template <typename Options>
class WhitelistTable {
 public:
  /// In the order in which they were first named.
  using Entries = tsl::ordered_map<std::string_view, WhitelistEntry<Options>, KeyHash>;

  WhitelistTable() = default;
  WhitelistTable(WhitelistTable&&) = default;  // a copy's entries would refer to the original

  /// Takes the entries of a group's list, `Options::kKeyList` or `Options::kPrefixList`. A key or
  /// prefix that is there takes the later options in its earlier place. Texts and options must
  /// outlive the table.
  void take(const std::string& group, std::string_view list, const PropertyDict& entries);

  const Entries& keys() const { return _keys; }
  const Entries& prefixes() const { return _prefixes; }

  /// By the exact key, else by the first prefix in order. Not for several threads at a time.
  WhitelistDecision<Options> decide(std::string_view key) const;
  /// By the first prefix alone. A prefix that another one decides is never reached.
  WhitelistDecision<Options> decideByPrefix(std::string_view key) const;

 private:
  const Options* keep(const Options& options);

  std::uint32_t _taken = 0;
  std::deque<Options> _options;  ///< of the entries; those in a row mostly have the same
  Entries _keys;
  Entries _prefixes;
  mutable std::optional<PrefixTable> _prefixTable;  ///< of `_prefixes`, once a look-up needs it
};

/// The tables of both kinds.
class WhitelistTables {
 public:
  /// Takes the lists of a group, which must be a dictionary. Returns the names of those that are
  /// not dictionaries and are skipped.
  std::vector<std::string_view> take(const WhitelistKeyGroup& group);

  template <typename Options>
  const WhitelistTable<Options>& of() const {
    return std::get<WhitelistTable<Options>>(_tables);
  }

 private:
  std::tuple<WhitelistTable<ScalarOptions>, WhitelistTable<DistributionOptions>> _tables;
};

}  // namespace vesprun
