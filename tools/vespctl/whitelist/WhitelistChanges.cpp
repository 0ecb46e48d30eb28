#include "whitelist/WhitelistChanges.h"

#include <algorithm>
#include <bit>
#include <cmath>
#include <compare>
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
PropertyDict readPartOf(const WhitelistEntry<Options>& entry) {
  return readPart<Options>(*entry.written->dict());
}

template <typename Options>
std::string optionsTextOf(const WhitelistEntry<Options>& entry) {
  return optionsText(readPartOf(entry), std::is_same_v<Options, DistributionOptions>);
}

/// What decides on a key without an entry of its own, for people; empty when nothing lets it leave.
template <typename Options>
std::string byPrefixNote(const WhitelistTable<Options>& table, std::string_view key,
                         const char* text) {
  const WhitelistDecision<Options> decision = table.decideByPrefix(key);
  return decision.options() == nullptr
             ? std::string()
             : text + inQuotes(decision.prefix) + ": " + optionsTextOf(*decision.entry);
}

template <typename Options>
Changes compareEntries(const WhitelistTable<Options>& before, const WhitelistTable<Options>& after,
                       bool arePrefixes) {
  const auto& entriesBefore = arePrefixes ? before.prefixes() : before.keys();
  const auto& entriesAfter = arePrefixes ? after.prefixes() : after.keys();
  std::vector<std::string_view> keys;
  for (const auto* entries : {&entriesBefore, &entriesAfter}) {
    for (const auto& [key, entry] : *entries) {
      keys.push_back(key);
    }
  }
  std::ranges::sort(keys);
  keys.erase(std::unique(keys.begin(), keys.end()), keys.end());
  const auto readable = [](const auto& entries, std::string_view key) {
    const auto found = entries.find(key);
    return found != entries.end() && found->second.options ? &found->second : nullptr;
  };
  Changes changes;
  for (const std::string_view key : keys) {
    const WhitelistEntry<Options>* from = readable(entriesBefore, key);
    const WhitelistEntry<Options>* to = readable(entriesAfter, key);
    if (from == nullptr && to != nullptr) {
      changes.added.push_back(
          {std::string(key), readPartOf(*to),
           byPrefixNote(before, key, arePrefixes ? "was covered by " : "left by the prefix ")});
    } else if (from != nullptr && to == nullptr) {
      const bool isHeldBack = entriesAfter.find(key) != entriesAfter.end();
      changes.removed.push_back(
          {std::string(key), readPartOf(*from),
           isHeldBack
               ? "its options cannot be read"
               : byPrefixNote(after, key, arePrefixes ? "covered by " : "leaves by the prefix ")});
    } else if (from != nullptr && !(*from->options == *to->options)) {
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
    return decision.entry != nullptr ? readPartOf(*decision.entry) : PropertyDict();
  };
  KindChanges changes;
  for (const std::string& key : keys) {
    const auto from =
        before != nullptr ? before->decide<Options>(key) : WhitelistDecision<Options>();
    const auto to = after.decide<Options>(key);
    const Options* fromOptions = from.options();
    const Options* toOptions = to.options();
    if (fromOptions == nullptr && toOptions != nullptr) {
      changes.keys.added.push_back({key, readPartOfDecision(to), {}});
    } else if (fromOptions != nullptr && toOptions == nullptr) {
      changes.keys.removed.push_back({key, readPartOfDecision(from), {}});
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
