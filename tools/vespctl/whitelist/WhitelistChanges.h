#pragma once

#include <set>
#include <string>
#include <vector>

#include "config/TBConfig.h"
#include "whitelist/WhitelistDocument.h"

namespace vesprun {

/// How much other options tell, as they are written: not whether a value would change.
enum class Effect { Finer, Different, Coarser };

/// Of options that are not equal.
Effect effectOf(const ScalarOptions& before, const ScalarOptions& after);
Effect effectOf(const DistributionOptions& before, const DistributionOptions& after);

const char* nameOf(Effect effect);

/// What a change lets out in all. Where a prefix lets out the keys of an entry that is missing, an
/// added one may let out less, and a removed one more.
enum class LetsOut { More, Less, Same };

/// What changes for keys, or for the entries of a list; each in ascending order.
struct Changes {
  struct Entry {
    std::string key;
    ReadOptions options;
    std::string instead;  ///< for people: what decides where the entry is missing
    LetsOut letsOut;
  };
  struct Change {
    std::string key;
    ReadOptions before;
    ReadOptions after;
    Effect effect;

    LetsOut letsOut() const { return effect == Effect::Coarser ? LetsOut::Less : LetsOut::More; }
  };

  std::vector<Entry> added;
  std::vector<Entry> removed;
  std::vector<Change> changed;
};

/// The changes of one kind, scalars or distributions.
struct KindChanges {
  Changes keys;
  Changes prefixes;                  ///< none in a comparison on a device
  std::vector<std::string> remarks;  ///< for people: the order of prefixes
};

struct WhitelistChanges {
  bool areOfDocuments;
  KindChanges scalars;
  KindChanges distributions;
  std::vector<std::string> remarks;  ///< for people: names of groups

  /// Whether something leaves that did not, or with other options than coarser ones.
  bool revealMore() const;
};

/// What changes for a device that is not internal and has no group switched off: by the entries,
/// whether another entry covers them or not. Entries that cannot be read count as not there.
WhitelistChanges compareDocuments(const WhitelistDocument& before, const WhitelistDocument& after);

using KeySet = std::set<std::string, std::less<>>;

/// What changes for these keys on the installed device when `after` replaces `before`, which may be
/// null.
WhitelistChanges compareOnDevice(const TBConfig* before, const TBConfig& after,
                                 const KeySet& scalars, const KeySet& distributions);

}  // namespace vesprun
