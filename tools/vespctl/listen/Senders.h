#pragma once

#include <sys/types.h>

#include <cstddef>
#include <cstdint>
#include <map>
#include <mutex>
#include <optional>
#include <set>
#include <string>
#include <vector>

#include "listen/StatsdLine.h"
#include "platform/host/HostPlatform.h"

namespace vesprun {

/// Who may count which keys, and how many a day. Foreign keys are looked up in ordered tables: none
/// can be chosen so that they are slow.
class Senders {
 public:
  static constexpr std::size_t kMaxKeys = 1'000;
  static constexpr std::size_t kMaxKeysOfOwner = 100'000;  ///< and of root
  static constexpr std::int64_t kMaxValues = 1'000'000;    ///< of one distribution

  /// The device must outlive the object.
  explicit Senders(HostPlatform& device);

  /// Begins a day with what was counted before: the keys that were noted, the values in the
  /// database, where all that was counted must be.
  void beginDay(std::int32_t day);

  /// Counts a change of the day for its sender, whose number is missing when the kernel did not say
  /// it. Or the reason why it may not be.
  std::optional<DropReason> admit(std::optional<uid_t> sender, const StatsdLine& line);

  /// Makes the senders' keys of the day durable, so that another start does not begin from 0.
  /// False, with a text in `error`, on failure. From any thread.
  bool noteKeys(std::string& error);

 private:
  using Prefixes = std::vector<std::string>;
  struct Sender {
    const Prefixes* prefixes;  ///< null: any key
    std::size_t maxKeys;
    std::set<std::string, std::less<>> keys;
  };

  Sender& senderOf(uid_t user);
  HostPath notePath() const;
  void readNote();
  void countValues();

  HostPlatform& _device;
  uid_t _owner;
  std::map<uid_t, Prefixes> _prefixesOfUsers;
  Prefixes _prefixesOfOthers;
  std::int32_t _day = 0;
  std::mutex _mutex;  ///< guards the members below
  std::map<uid_t, Sender> _senders;
  std::map<std::string, std::int64_t, std::less<>> _valuesOfDistributions;
  bool _hasNewKeys = false;
};

}  // namespace vesprun
