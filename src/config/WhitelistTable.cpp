#include "config/WhitelistTable.h"

#include <algorithm>

namespace vesprun {
namespace {

template <typename Options>
bool isListOf(std::string_view name) {
  return name == Options::kKeyList || name == Options::kPrefixList;
}

}  // namespace

template <typename Options>
void WhitelistTable<Options>::take(std::string_view group, std::string_view list,
                                   const PropertyDict& entries) {
  Entries& table = list == Options::kKeyList ? _keys : _prefixes;
  for (const auto& [key, written] : entries) {
    const PropertyDict* options = written.dict();
    table.insert_or_assign(
        key, WhitelistEntry<Options>{group, &written,
                                     options != nullptr ? Options::read(*options) : std::nullopt});
  }
}

template <typename Options>
void WhitelistTable<Options>::indexPrefixes() {
  std::vector<std::string_view> texts;
  texts.reserve(_prefixes.size());
  for (const auto& [prefix, entry] : _prefixes) {
    texts.push_back(prefix);
  }
  _prefixTable = PrefixTable(texts);
}

template <typename Options>
WhitelistDecision<Options> WhitelistTable<Options>::decide(std::string_view key) const {
  auto named = _keys.nth(std::min(_expected, _keys.size()));
  if (named == _keys.end() || named.key() != key) {
    named = _keys.find(key);
  }
  if (named != _keys.end()) {
    _expected = static_cast<std::size_t>(named - _keys.begin()) + 1;
    return {DecidedBy::Key, {}, &named->second};
  }
  return decideByPrefix(key);
}

template <typename Options>
WhitelistDecision<Options> WhitelistTable<Options>::decideByPrefix(std::string_view key) const {
  if (const std::optional<std::size_t> place = _prefixTable.find(key)) {
    const auto& [prefix, entry] = *_prefixes.nth(*place);
    return {DecidedBy::Prefix, prefix, &entry};
  }
  return {};
}

std::vector<std::string_view> WhitelistTables::take(const WhitelistKeyGroup& group) {
  std::vector<std::string_view> skipped;
  for (const auto& [list, entries] : *group.lists.dict()) {
    const bool ofScalars = isListOf<ScalarOptions>(list);
    if (!ofScalars && !isListOf<DistributionOptions>(list)) {
      continue;
    }
    if (entries.dict() == nullptr) {
      skipped.push_back(list);
    } else if (ofScalars) {
      _scalars.take(group.name, list, *entries.dict());
    } else {
      _distributions.take(group.name, list, *entries.dict());
    }
  }
  return skipped;
}

void WhitelistTables::indexPrefixes() {
  _scalars.indexPrefixes();
  _distributions.indexPrefixes();
}

template class WhitelistTable<ScalarOptions>;
template class WhitelistTable<DistributionOptions>;

}  // namespace vesprun
