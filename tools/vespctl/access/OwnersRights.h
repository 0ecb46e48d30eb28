#pragma once

#include <sys/stat.h>

#include <string>

namespace vesprun {

enum class OwnersRights {
  ForGood,
  UntilFileIsWritten,  ///< `RightsOfCaller` can end them for a while
};

/// As root on a directory of another user: goes on as that user, with that user's groups, so that
/// no link or file in it can lead further than its owner could go. New files have the directory's
/// group when that is one of the owner's. Does nothing for anyone else. Throws `CommandFailure`.
void takeRightsOfOwner(const struct stat& directory, OwnersRights rights);

/// As long as it lives, a process that took an owner's rights has those of its start again: for a
/// FILE that the command line names.
class RightsOfCaller {
 public:
  RightsOfCaller();
  ~RightsOfCaller();
  RightsOfCaller(const RightsOfCaller&) = delete;
  RightsOfCaller& operator=(const RightsOfCaller&) = delete;

 private:
  uid_t _user;
  gid_t _group;
};

/// The name of a user, or the number where there is none.
std::string nameOfUser(uid_t user);

}  // namespace vesprun
