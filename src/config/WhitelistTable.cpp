#include "config/WhitelistTable.h"

namespace vesprun {

template <typename Options>
void WhitelistTable<Options>::take(const std::string& group, std::string_view list,
                                   const PropertyDict& entries) {
  _prefixTable.reset();
  Entries& table = list == Options::kKeyList ? _keys : _prefixes;
  for (const auto& [key, written] : entries) {
    const PropertyDict* const dict = written.dict();
    const auto options = dict != nullptr ? Options::read(*dict) : std::optional<Options>();
    table.insert_or_assign(
        key, WhitelistEntry<Options>{&group, &written, options ? keep(*options) : nullptr, _taken++,
                                     dict != nullptr && unreadOption<Options>(*dict) != nullptr});
  }
}

template <typename Options>
const Options* WhitelistTable<Options>::keep(const Options& options) {
  if (_options.empty() || !_options.back().isSameAs(options)) {
    _options.push_back(options);
  }
  return &_options.back();
}

template <typename Options>
WhitelistDecision<Options> WhitelistTable<Options>::decide(std::string_view key) const {
  const auto named = _keys.find(key);
  return named != _keys.end() ? WhitelistDecision<Options>{DecidedBy::Key, {}, &named->second}
                              : decideByPrefix(key);
}

template <typename Options>
WhitelistDecision<Options> WhitelistTable<Options>::decideByPrefix(std::string_view key) const {
  if (!_prefixTable) {
    std::vector<std::string_view> texts;
    texts.reserve(_prefixes.size());
    for (const auto& [prefix, entry] : _prefixes) {
      texts.push_back(prefix);
    }
    _prefixTable.emplace(texts);
  }
  if (const std::optional<std::size_t> place = _prefixTable->find(key)) {
    const auto& [prefix, entry] = *_prefixes.nth(*place);
    return {DecidedBy::Prefix, prefix, &entry};
  }
  return {};
}

std::vector<std::string_view> WhitelistTables::take(const WhitelistKeyGroup& group) {
  std::vector<std::string_view> skipped;
  const auto takeIfOfKind = [&]<typename Options>(WhitelistTable<Options>& table,
                                                  std::string_view list,
                                                  const PropertyValue& entries) {
    if (list == Options::kKeyList || list == Options::kPrefixList) {
      if (entries.dict() != nullptr) {
        table.take(group.name, list, *entries.dict());
      } else {
        skipped.push_back(list);
      }
    }
  };
  for (const auto& [list, entries] : *group.lists.dict()) {
    takeIfOfKind(std::get<0>(_tables), list, entries);
    takeIfOfKind(std::get<1>(_tables), list, entries);
  }
  return skipped;
}

template class WhitelistTable<ScalarOptions>;
template class WhitelistTable<DistributionOptions>;

}  // namespace vesprun
