#include "whitelist/WhitelistChanges.h"

#include <algorithm>
#include <bit>
#include <cmath>
#include <limits>
#include <tuple>
#include <unordered_map>

namespace vesprun {
namespace {

Effect effectOf(bool tellsMore, bool tellsLess) {
  return tellsMore == tellsLess ? Effect::Different : tellsLess ? Effect::Coarser : Effect::Finer;
}

/// Orders numbers so that equal values, whatever their kinds, are equal. Not by size.
using Canonical = std::tuple<bool, bool, std::uint64_t>;

Canonical canonical(const Number& number) {
  if (!number.isFloatingPoint()) {
    return {true, number.isSigned() && number.asInt64() < 0, number.asUInt64()};
  }
  const double real = number.asDouble();
  if (Number(number.asInt64()) == number) {
    return canonical(Number(number.asInt64()));
  }
  if (Number(number.asUInt64()) == number) {
    return canonical(Number(number.asUInt64()));
  }
  return {false, false,
          std::bit_cast<std::uint64_t>(std::isnan(real) ? std::numeric_limits<double>::quiet_NaN()
                                                        : real)};
}

std::vector<Canonical> boundarySet(const DistributionOptions& options) {
  std::vector<Canonical> set;
  if (options.intervals != nullptr) {
    for (const PropertyValue& boundary : *options.intervals) {
      set.push_back(canonical(*boundary.number()));
    }
  }
  std::ranges::sort(set);
  set.erase(std::unique(set.begin(), set.end()), set.end());
  return set;
}

template <typename Options>
ReadOptions readPartOf(const WhitelistEntry<Options>& entry) {
  return readPart<Options>(*entry.written->dict());
}

template <typename Options>
std::string optionsTextOf(const WhitelistEntry<Options>& entry) {
  return optionsText(readPartOf(entry), std::is_same_v<Options, DistributionOptions>);
}

/// An added or removed entry, which the other table lacks or cannot read.
template <typename Options>
Changes::Entry missingEntry(std::string_view key, const WhitelistEntry<Options>& entry,
                            const WhitelistTable<Options>& other, bool isPrefix, bool isAdded) {
  Changes::Entry told{std::string(key), readPartOf(entry), "no entry",
                      isAdded ? LetsOut::More : LetsOut::Less};
  const auto& entries = isPrefix ? other.prefixes() : other.keys();
  if (entries.find(key) != entries.end()) {
    told.instead = "held back, since its options cannot be read";
    return told;
  }
  const WhitelistDecision<Options> decision = other.decideByPrefix(key);
  const Options* const byPrefix = decision.options();
  if (byPrefix == nullptr) {
    return told;
  }
  told.instead.append(isAdded ? (isPrefix ? ", was covered by " : ", left by the prefix ")
                              : (isPrefix ? ", covered by " : ", leaves by the prefix "));
  told.instead.append(inQuotes(decision.prefix))
      .append(": ")
      .append(optionsTextOf(*decision.entry));
  const Options& from = isAdded ? *byPrefix : *entry.options;
  const Options& to = isAdded ? *entry.options : *byPrefix;
  told.letsOut = from == to                                       ? LetsOut::Same
                 : vesprun::effectOf(from, to) == Effect::Coarser ? LetsOut::Less
                                                                  : LetsOut::More;
  return told;
}

/// An entry before and after, each null when it is not there or cannot be read.
template <typename Options>
struct EntryPair {
  std::string_view key;
  const WhitelistEntry<Options>* from;
  const WhitelistEntry<Options>* to;
};

/// The entries that differ, in ascending order of their keys.
template <typename Options>
std::vector<EntryPair<Options>> differingEntries(
    const typename WhitelistTable<Options>::Entries& before,
    const typename WhitelistTable<Options>::Entries& after) {
  const auto readable = [](const WhitelistEntry<Options>& entry) {
    return entry.options ? &entry : nullptr;
  };
  std::vector<EntryPair<Options>> pairs;
  for (const auto& [key, entry] : before) {
    const auto other = after.find(key);
    const auto* from = readable(entry);
    const auto* to = other != after.end() ? readable(other->second) : nullptr;
    const bool areBoth = from != nullptr && to != nullptr;
    if (areBoth ? !(*from->options == *to->options) : from != to) {
      pairs.push_back({key, from, to});
    }
  }
  for (const auto& [key, entry] : after) {
    if (entry.options && before.find(key) == before.end()) {
      pairs.push_back({key, nullptr, &entry});
    }
  }
  std::ranges::sort(pairs, {}, &EntryPair<Options>::key);
  return pairs;
}

template <typename Options>
Changes compareEntries(const WhitelistTable<Options>& before, const WhitelistTable<Options>& after,
                       bool arePrefixes) {
  const auto& entriesBefore = arePrefixes ? before.prefixes() : before.keys();
  const auto& entriesAfter = arePrefixes ? after.prefixes() : after.keys();
  Changes changes;
  for (const auto& [key, from, to] : differingEntries<Options>(entriesBefore, entriesAfter)) {
    if (from == nullptr) {
      changes.added.push_back(missingEntry(key, *to, before, arePrefixes, true));
    } else if (to == nullptr) {
      changes.removed.push_back(missingEntry(key, *from, after, arePrefixes, false));
    } else {
      changes.changed.push_back({std::string(key), readPartOf(*from), readPartOf(*to),
                                 vesprun::effectOf(*from->options, *to->options)});
    }
  }
  return changes;
}

/// What the order of the prefixes that are in both changes: the first one that matches decides.
template <typename Options>
std::vector<std::string> compareOrder(const WhitelistTable<Options>& before,
                                      const WhitelistTable<Options>& after) {
  std::unordered_map<std::string_view, std::size_t> places;
  for (const auto& [prefix, entry] : before.prefixes()) {
    places.emplace(prefix, places.size());
  }
  std::vector<std::string> remarks;
  std::size_t last = 0;
  bool isInOrder = true;
  for (const auto& [prefix, entry] : after.prefixes()) {
    const auto place = places.find(prefix);
    if (place == places.end()) {
      continue;
    }
    isInOrder = isInOrder && place->second >= last;
    last = place->second;
    const std::string_view from = before.decideByPrefix(prefix).prefix;
    const WhitelistDecision<Options> to = after.decideByPrefix(prefix);
    if (from != to.prefix) {
      const std::string options = to.entry->options ? optionsTextOf(*to.entry) : "held back";
      remarks.push_back("Keys that begin with " + inQuotes(prefix) + " are decided by " +
                        inQuotes(to.prefix) + " (" + options + "), not by " + inQuotes(from) +
                        " as before.");
    }
  }
  if (!isInOrder) {
    remarks.insert(remarks.begin(),
                   "The order of prefixes changed, and the first one that matches decides.");
  }
  return remarks;
}

template <typename Options>
KindChanges compareKind(const WhitelistTables& before, const WhitelistTables& after) {
  const auto& from = before.of<Options>();
  const auto& to = after.of<Options>();
  return {compareEntries(from, to, false), compareEntries(from, to, true), compareOrder(from, to)};
}

template <typename Options>
KindChanges compareKeys(const TBConfig* before, const TBConfig& after, const KeySet& keys) {
  const auto readPartOfDecision = [](const WhitelistDecision<Options>& decision) {
    return decision.entry != nullptr ? readPartOf(*decision.entry) : ReadOptions();
  };
  KindChanges changes;
  for (const std::string& key : keys) {
    const auto from =
        before != nullptr ? before->decide<Options>(key) : WhitelistDecision<Options>();
    const auto to = after.decide<Options>(key);
    const Options* fromOptions = from.options();
    const Options* toOptions = to.options();
    if (fromOptions == nullptr && toOptions != nullptr) {
      changes.keys.added.push_back({key, readPartOfDecision(to), "stays", LetsOut::More});
    } else if (fromOptions != nullptr && toOptions == nullptr) {
      changes.keys.removed.push_back({key, readPartOfDecision(from), "stays", LetsOut::Less});
    } else if (fromOptions != nullptr && !(*fromOptions == *toOptions)) {
      changes.keys.changed.push_back({key, readPartOfDecision(from), readPartOfDecision(to),
                                      vesprun::effectOf(*fromOptions, *toOptions)});
    }
  }
  return changes;
}

std::set<std::string_view> groupNames(const WhitelistDocument& document) {
  std::set<std::string_view> names;
  for (const auto& group : document.groups()) {
    names.insert(group.name);
  }
  return names;
}

}  // namespace

Effect effectOf(const ScalarOptions& before, const ScalarOptions& after) {
  // Both sizes grow with how much a value tells: 0 is the largest interval, and none the smallest.
  constexpr std::uint64_t kMax = std::numeric_limits<std::uint64_t>::max();
  const auto ofInterval = [](const ScalarOptions& options) {
    return options.bucketInterval
               ? std::pair(0, *options.bucketInterval == 0 ? 0 : kMax - *options.bucketInterval + 1)
               : std::pair(1, std::uint64_t{0});
  };
  const auto ofDigits = [](const ScalarOptions& options) {
    return options.significantDigits ? std::pair(0, *options.significantDigits)
                                     : std::pair(1, std::uint64_t{0});
  };
  return effectOf(ofInterval(after) > ofInterval(before) || ofDigits(after) > ofDigits(before),
                  ofInterval(after) < ofInterval(before) || ofDigits(after) < ofDigits(before));
}

Effect effectOf(const DistributionOptions& before, const DistributionOptions& after) {
  const std::vector<Canonical> from = boundarySet(before);
  const std::vector<Canonical> to = boundarySet(after);
  return effectOf(from.size() < to.size() && std::ranges::includes(to, from),
                  to.size() < from.size() && std::ranges::includes(from, to));
}

const char* nameOf(Effect effect) {
  return effect == Effect::Coarser ? "coarser" : effect == Effect::Finer ? "finer" : "different";
}

bool WhitelistChanges::revealMore() const {
  for (const Changes* changes :
       {&scalars.keys, &scalars.prefixes, &distributions.keys, &distributions.prefixes}) {
    if (!changes->added.empty() ||
        std::ranges::any_of(changes->changed, [](const Changes::Change& change) {
          return change.effect != Effect::Coarser;
        })) {
      return true;
    }
  }
  return false;
}

WhitelistChanges compareDocuments(const WhitelistDocument& before, const WhitelistDocument& after) {
  const WhitelistTables from = before.tables(false);
  const WhitelistTables to = after.tables(false);
  WhitelistChanges changes{
      true, compareKind<ScalarOptions>(from, to), compareKind<DistributionOptions>(from, to), {}};
  const std::set<std::string_view> namesBefore = groupNames(before);
  const std::set<std::string_view> namesAfter = groupNames(after);
  const auto tellNew = [&changes](const auto& names, const auto& known, const char* what) {
    for (const std::string_view name : names) {
      if (!known.contains(name)) {
        changes.remarks.push_back(what + inQuotes(name) + '.');
      }
    }
  };
  tellNew(namesAfter, namesBefore, "A new group, which can be switched off by its name: ");
  tellNew(namesBefore, namesAfter, "No group of this name any more: ");
  return changes;
}

WhitelistChanges compareOnDevice(const TBConfig* before, const TBConfig& after,
                                 const KeySet& scalars, const KeySet& distributions) {
  return {false,
          compareKeys<ScalarOptions>(before, after, scalars),
          compareKeys<DistributionOptions>(before, after, distributions),
          {}};
}

}  // namespace vesprun
