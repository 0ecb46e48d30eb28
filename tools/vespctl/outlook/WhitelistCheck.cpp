#include "outlook/WhitelistCheck.h"

#include <cmath>
#include <type_traits>
#include <unordered_map>
#include <utility>

#include "config/WhitelistTable.h"
#include "platform/host/documents/PtreeReader.h"
#include "platform/host/documents/QuotedText.h"

namespace vesprun {
namespace {

// The document as it is written, including entries that a later one of the same name replaces.
struct WrittenEntry {
  std::string name;
  PropertyValue value;
};
struct WrittenList {
  std::string name;
  bool isDict;
  std::vector<WrittenEntry> entries;
};
struct WrittenGroup {
  std::string name;
  bool isDict;
  std::vector<WrittenList> lists;
};

/// Calls `judge` with each, and whether another one of that name follows.
template <typename Written, typename Judge>
void forEachWithRepeats(const std::vector<Written>& written, const Judge& judge) {
  std::unordered_map<std::string_view, std::size_t> last;
  for (std::size_t i = 0; i < written.size(); ++i) {
    last[written[i].name] = i;
  }
  for (std::size_t i = 0; i < written.size(); ++i) {
    judge(written[i], last[written[i].name] != i);
  }
}

bool doNotRise(const PropertyArray& intervals) {
  for (std::size_t i = 1; i < intervals.size(); ++i) {
    // Not `>=`: a NaN does not rise either.
    if (!(intervals[i - 1].number()->asDouble() < intervals[i].number()->asDouble())) {
      return true;
    }
  }
  return false;
}

class WhitelistCheck {
 public:
  explicit WhitelistCheck(const PropertyDict& document) {
    for (const auto& [name, lists] : document) {
      if (lists.dict() != nullptr) {
        const WhitelistKeyGroup group{name, lists};
        _onInternalDevices.take(group);
        if (!WhitelistKeyGroup::isForInternalDevices(name)) {
          _onOtherDevices.take(group);
        }
      }
    }
  }

  void judge(const WrittenGroup& group, bool isRepeated) {
    _place = {group.name, std::nullopt, std::nullopt, nullptr, {}};
    if (isRepeated) {
      tell("stands twice", "a later group of that name replaces it: put their lists into one");
    } else if (!group.isDict) {
      tell("wrong kind", "a group is a dictionary of lists, so this one is skipped: correct it");
    } else {
      forEachWithRepeats(group.lists, [this](const WrittenList& list, bool isRepeatedList) {
        _place.list = list.name;
        _place.key.reset();
        judge(list, isRepeatedList);
      });
    }
  }

  std::vector<WhitelistFinding> takeFindings() { return std::move(_findings); }

 private:
  void tell(const char* finding, std::string detail) {
    _findings.push_back(_place);
    _findings.back().finding = finding;
    _findings.back().detail = std::move(detail);
  }

  void judge(const WrittenList& list, bool isRepeated) {
    if (list.name == ScalarOptions::kKeyList || list.name == ScalarOptions::kPrefixList) {
      judgeList<ScalarOptions>(list, isRepeated);
    } else if (list.name == DistributionOptions::kKeyList ||
               list.name == DistributionOptions::kPrefixList) {
      judgeList<DistributionOptions>(list, isRepeated);
    } else {
      tell("unknown list",
           "nothing reads it: it is none of ScalarKeys, ScalarKeyPrefixes, DistributionKeys and "
           "DistributionKeyPrefixes; correct the name or remove it");
    }
  }

  template <typename Options>
  void judgeList(const WrittenList& list, bool isRepeated) {
    if (isRepeated) {
      tell("stands twice", "a later list of that name replaces it: put their entries into one");
    } else if (!list.isDict) {
      tell("wrong kind",
           "a list is a dictionary of keys and their options, so this one is skipped: correct it");
    } else {
      forEachWithRepeats(list.entries, [&](const WrittenEntry& entry, bool isRepeatedEntry) {
        _place.key = entry.name;
        judgeEntry<Options>(entry, list.name == Options::kPrefixList, isRepeatedEntry);
      });
    }
  }

  template <typename Options>
  void judgeEntry(const WrittenEntry& entry, bool isPrefix, bool isRepeated) {
    const PropertyDict* written = entry.value.dict();
    const auto options = written != nullptr ? Options::read(*written) : std::nullopt;
    if (!options) {
      tell("unreadable options",
           written == nullptr ? "options are a dictionary; until they are, this is held back"
                              : "an option is not of its kind, so this is held back: correct it");
    }
    if (written != nullptr) {
      for (const auto& [name, value] : *written) {
        judgeOption(Options(), std::string(name), value);
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
    if (isRepeated) {
      tell("stands twice", "the later one replaces it: remove one of them");
      return;
    }
    const WhitelistTable<Options>& table = tables().template of<Options>();
    const auto& entries = isPrefix ? table.prefixes() : table.keys();
    if (const std::string_view last = entries.at(entry.name).group; last != _place.group) {
      tell("replaced by a later group",
           "the group " + quotedText(last) + " names it again, and its options count: remove one");
      return;
    }
    const WhitelistDecision<Options> byPrefix = table.decideByPrefix(entry.name);
    if (byPrefix.by == DecidedBy::Nothing) {
      return;
    }
    if (isPrefix && byPrefix.prefix != entry.name) {
      tell("prefix never reached", "the prefix " + quotedText(byPrefix.prefix) + " of group " +
                                       quotedText(byPrefix.entry->group) +
                                       " covers it: put it before that one, or remove it");
    } else if (!isPrefix && options && options == byPrefix.entry->options) {
      tell("same as its prefix", "the prefix " + quotedText(byPrefix.prefix) + " of group " +
                                     quotedText(byPrefix.entry->group) +
                                     " lets it in with the same options: remove it");
    }
  }

  /// The tables of the groups that count together with the judged one.
  const WhitelistTables& tables() const {
    return WhitelistKeyGroup::isForInternalDevices(_place.group) ? _onInternalDevices
                                                                 : _onOtherDevices;
  }

  void judgeOption(const ScalarOptions& /*kind*/, const std::string& name,
                   const PropertyValue& value) {
    const bool isInterval = name == ScalarOptions::kBucketInterval;
    if (!isInterval && name != ScalarOptions::kSignificantDigits) {
      tellUnread(name);
    } else if (const Number* number = value.number()) {
      const double real = number->asDouble();
      if (!(real >= 0 && real == std::trunc(real))) {
        tell("doubtful number", name + " is read as " + std::to_string(number->asUInt64()) +
                                    ": write a whole number from 0 on");
      } else if (real == 0) {
        tell(isInterval ? "interval is 0" : "digit count is 0",
             isInterval ? "every value is reported as 0: write the width of a bucket"
                        : "no digit is kept, so values become 0 or a power of ten: write how many");
      }
    }
  }

  void judgeOption(const DistributionOptions& /*kind*/, const std::string& name,
                   const PropertyValue& /*value*/) {
    if (name != DistributionOptions::kIntervals) {
      tellUnread(name);
    }
  }

  void tellUnread(const std::string& name) {
    tell("unread option",
         "nothing reads " + quotedText(name) + " in this list: correct the name or remove it");
  }

  WhitelistTables _onInternalDevices;
  WhitelistTables _onOtherDevices;
  WhitelistFinding _place{};
  std::vector<WhitelistFinding> _findings;
};

}  // namespace

std::optional<std::vector<WhitelistFinding>> checkWhitelist(std::string_view bytes,
                                                            std::string& error) {
  std::vector<WrittenGroup> groups;
  std::vector<WrittenList> lists;
  std::vector<WrittenEntry> entries;
  // Entries come before the list that holds them, and lists before their group.
  const auto take = [&](std::span<const std::string_view> keys, std::size_t,
                        const PropertyValue& value) {
    const std::string name(keys.back());
    const bool isDict = value.dict() != nullptr;
    if (keys.size() == 1) {
      groups.push_back({name, isDict, std::exchange(lists, {})});
    } else if (keys.size() == 2) {
      lists.push_back({name, isDict, std::exchange(entries, {})});
    } else if (keys.size() == 3) {
      entries.push_back({name, value});
    }
  };
  const std::optional<PropertyValue> document = readPtreeEntries(bytes, error, take);
  if (!document || document->dict() == nullptr) {
    error = document ? "the root is not a dictionary" : error;
    return std::nullopt;
  }
  WhitelistCheck check(*document->dict());
  forEachWithRepeats(groups, [&check](const WrittenGroup& group, bool isRepeated) {
    check.judge(group, isRepeated);
  });
  return check.takeFindings();
}

}  // namespace vesprun
