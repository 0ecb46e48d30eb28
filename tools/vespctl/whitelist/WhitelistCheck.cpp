#include "whitelist/WhitelistCheck.h"

#include <algorithm>
#include <cmath>
#include <type_traits>
#include <utility>

#include "common/Calendar.h"

namespace vesprun {
namespace {

using Node = WhitelistDocument::Node;

bool doNotRise(const PropertyArray& intervals) {
  for (std::size_t i = 1; i < intervals.size(); ++i) {
    // Not `>=`: a NaN does not rise either.
    if (!(intervals[i - 1].number()->asDouble() < intervals[i].number()->asDouble())) {
      return true;
    }
  }
  return false;
}

/// Whether the prefix says no more than the first word of keys.
bool isBroad(std::string_view prefix) {
  return !prefix.empty() && prefix.substr(0, prefix.size() - 1).find('.') == prefix.npos;
}

class WhitelistCheck {
 public:
  WhitelistCheck(const WhitelistDocument& document, std::int32_t today,
                 const std::vector<std::string>& required)
      : _onInternalDevices(document.tables(true)),
        _onOtherDevices(document.tables(false)),
        _today(today),
        _required(required) {}

  void judgeGroup(const Node& group) {
    _place = {group.name, std::nullopt, std::nullopt, group.line, {}, {}};
    if (group.value == nullptr) {
      tell("duplicate", "a later group of that name replaces it: put their lists into one");
    } else if (group.dict() == nullptr) {
      tell("wrong kind", "a group is a dictionary of lists, so this one is skipped: correct it");
    } else {
      _about = aboutOf(*group.dict());
      for (const Node& list : group.below) {
        _place.list = list.name;
        _place.key.reset();
        _place.line = list.line;
        judgeList(list);
      }
    }
  }

  std::vector<WhitelistFinding> takeFindings() { return std::move(_findings); }

 private:
  void tell(std::string_view finding, std::string detail) {
    _findings.push_back(_place);
    _findings.back().finding = finding;
    _findings.back().detail = std::move(detail);
  }

  void judgeList(const Node& list) {
    const bool isList = withKindOfList(list.name, [&]<typename Options>(Options) {
      if (canJudge(list,
                   "a list is a dictionary of keys and their options, so this one is skipped: "
                   "correct it")) {
        for (const Node& entry : list.below) {
          _place.key = entry.name;
          _place.line = entry.line;
          judgeEntry<Options>(entry, list.name == Options::kPrefixList);
        }
      }
    });
    if (isList) {
      return;
    }
    if (list.name != EntryMetadata::kAbout) {
      tell("unknown list",
           "nothing reads it: it is none of ScalarKeys, ScalarKeyPrefixes, DistributionKeys and "
           "DistributionKeyPrefixes, nor About; correct the name or remove it");
    } else if (list.value != nullptr && list.dict() == nullptr) {
      tell("wrong metadata", "\"About\" is a dictionary of owner, reason and expires: correct it");
    } else if (canJudge(list, {})) {
      for (const Node& entry : list.below) {
        _place.line = entry.line;
        if (entry.value == nullptr) {
          tell("duplicate", "a later " + inQuotes(entry.name) + " replaces it: remove one of them");
        } else {
          judgeMetadata(entry.name, *entry.value);
        }
      }
    }
  }

  bool canJudge(const Node& list, const char* wrongKind) {
    if (list.value == nullptr) {
      tell("duplicate", "a later list of that name replaces it: put their entries into one");
    } else if (list.dict() == nullptr) {
      tell("wrong kind", wrongKind);
    }
    return list.dict() != nullptr;
  }

  template <typename Options>
  void judgeEntry(const Node& entry, bool isPrefix) {
    if (entry.value == nullptr) {
      tell("duplicate", "the later one replaces it: remove one of them");
      return;
    }
    const PropertyDict* written = entry.dict();
    const auto options = written != nullptr ? Options::read(*written) : std::nullopt;
    if (!options) {
      tell("unreadable options",
           written == nullptr ? "options are a dictionary; until they are, this is held back"
                              : "an option is not of its kind, so this is held back: correct it");
    }
    if (written != nullptr) {
      std::string rest;  // what is left without what nothing reads
      for (const auto& [name, value] : *written) {
        if (EntryMetadata::isName(name)) {
          judgeMetadata(name, value);
        } else if (Options::isRead(name)) {
          judgeOption(Options(), name, value);
        } else {
          if (rest.empty()) {
            constexpr bool kIsDistribution = std::is_same_v<Options, DistributionOptions>;
            const ReadOptions read = readPart<Options>(*written);
            rest = (read.empty() && !kIsDistribution ? "" : "with ") +
                   shortened(optionsText(read, kIsDistribution));
          }
          tell("unread option", "nothing reads " + inQuotes(name) +
                                    " in this list, so the value leaves " + rest +
                                    ": correct the name or remove it");
        }
      }
    }
    if constexpr (std::is_same_v<Options, DistributionOptions>) {
      if (options && options->intervals != nullptr && doNotRise(*options->intervals)) {
        tell("intervals do not rise",
             "a bucket that does not end above the one before it stays empty: put them in order");
      }
    }
    if (isPrefix && entry.name.empty()) {
      tell("empty prefix", "it lets every key in: name what is meant to leave");
    }
    if (isPrefix && isBroad(entry.name)) {
      tell("broad prefix",
           "it lets in all that will ever be counted below this one word: name what is meant");
    }
    judgeWhatDecides(entry, isPrefix, options);
    judgeRequired(written);
    const EntryMetadata metadata = EntryMetadata::read(written, _about);
    if (metadata.expires != nullptr && daysSince1970(*metadata.expires) < _today) {
      tell("expired", "it was wanted until " + dateText(*metadata.expires) +
                          ": remove it, or ask its owner for a later date");
    }
  }

  template <typename Options>
  void judgeWhatDecides(const Node& entry, bool isPrefix, const std::optional<Options>& options) {
    const WhitelistTable<Options>& table = tables().template of<Options>();
    const auto& entries = isPrefix ? table.prefixes() : table.keys();
    if (const std::string& last = *entries.at(entry.name).group; last != _place.group) {
      tell("replaced by a later group",
           "the group " + inQuotes(last) + " names it again, and its options count: remove one");
      return;
    }
    const WhitelistDecision<Options> byPrefix = table.decideByPrefix(entry.name);
    if (byPrefix.by == DecidedBy::Nothing) {
      return;
    }
    const auto prefixText = [&byPrefix] {
      return "the prefix " + inQuotes(byPrefix.prefix) + " of group " +
             inQuotes(*byPrefix.entry->group);
    };
    if (isPrefix && byPrefix.prefix != entry.name) {
      tell("prefix never reached",
           prefixText() + " covers it: put it before that one, or remove it");
    } else if (!isPrefix && options && byPrefix.options() != nullptr &&
               *options == *byPrefix.options()) {
      tell("same as its prefix", prefixText() + " lets it in with the same options: remove it");
    }
  }

  void judgeRequired(const PropertyDict* written) {
    std::string missing;
    for (const std::string& name : _required) {
      if ((written == nullptr || !written->contains(name)) &&
          (_about == nullptr || !_about->contains(name))) {
        missing.append(missing.empty() ? "" : " and ").append(name);
      }
    }
    if (!missing.empty()) {
      tell("missing metadata",
           "neither it nor its group's \"About\" has " + missing + ": say who wants it and why");
    }
  }

  /// The tables of the groups that count together with the judged one.
  const WhitelistTables& tables() const {
    return WhitelistKeyGroup::isForInternalDevices(_place.group) ? _onInternalDevices
                                                                 : _onOtherDevices;
  }

  void judgeMetadata(std::string_view name, const PropertyValue& value) {
    const bool isDate = name == EntryMetadata::kExpires;
    if (EntryMetadata::isName(name) &&
        (isDate ? value.date() == nullptr : value.string() == nullptr)) {
      tell("wrong metadata", std::string(name) + (isDate ? " is a date" : " is a string") +
                                 ", so this one says nothing: correct it");
    }
  }

  void judgeOption(const ScalarOptions& /*kind*/, std::string_view name,
                   const PropertyValue& value) {
    const bool isInterval = name == ScalarOptions::kBucketInterval;
    if (const Number* number = value.number()) {
      const double real = number->asDouble();
      if (!(real >= 0 && real == std::trunc(real))) {
        tell("doubtful number", std::string(name) + " is read as " +
                                    std::to_string(number->asUInt64()) +
                                    ": write a whole number from 0 on");
      } else if (real == 0) {
        tell(isInterval ? "interval is 0" : "digit count is 0",
             isInterval ? "every value is reported as 0: write the width of a bucket"
                        : "no digit is kept, so values become 0 or a power of ten: write how many");
      }
    }
  }
  void judgeOption(const DistributionOptions& /*kind*/, std::string_view, const PropertyValue&) {}

  WhitelistTables _onInternalDevices;
  WhitelistTables _onOtherDevices;
  std::int32_t _today;
  const std::vector<std::string>& _required;
  const PropertyDict* _about = nullptr;  ///< of the judged group
  WhitelistFinding _place{};
  std::vector<WhitelistFinding> _findings;
};

}  // namespace

bool WhitelistFinding::isGrave() const {
  constexpr std::string_view kGrave[] = {"wrong kind",      "unknown list",  "unreadable options",
                                         "doubtful number", "unread option", "empty prefix"};
  return std::ranges::find(kGrave, finding) != std::end(kGrave);
}

std::string placeOf(const WhitelistFinding& finding, const std::string& file) {
  std::string place =
      file + ':' + std::to_string(finding.line) + ": group " + inQuotes(finding.group);
  if (finding.list) {
    place.append(", ").append(shortened(*finding.list));
  }
  if (finding.key) {
    place.append(", ").append(inQuotes(*finding.key));
  }
  return place.append(": ").append(finding.finding);
}

std::vector<WhitelistFinding> checkWhitelist(const WhitelistDocument& document, std::int32_t today,
                                             const std::vector<std::string>& required) {
  WhitelistCheck check(document, today, required);
  for (const Node& group : document.groups()) {
    check.judgeGroup(group);
  }
  return check.takeFindings();
}

}  // namespace vesprun
