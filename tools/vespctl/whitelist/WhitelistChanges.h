#pragma once

#include <set>
#include <string>
#include <string_view>
#include <vector>

#include "config/TBConfig.h"
#include "whitelist/WhitelistDocument.h"

namespace vesprun {

/// How much other options tell, as they are written: not whether a value would change.
enum class Effect { Coarser, Finer, Different };

/// Of options that are not equal.
Effect effectOf(const ScalarOptions& before, const ScalarOptions& after);
Effect effectOf(const DistributionOptions& before, const DistributionOptions& after);

const char* nameOf(Effect effect);

/// What changes for keys, or for the entries of a list; each in ascending order.
struct Changes {
  struct Entry {
    std::string key;
    PropertyDict options;  ///< those that a report reads
    std::string note;      ///< for people, or empty
  };
  struct Change {
    std::string key;
    PropertyDict before;
    PropertyDict after;
    Effect effect;
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
