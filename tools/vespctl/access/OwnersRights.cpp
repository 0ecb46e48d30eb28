#include "access/OwnersRights.h"

#include <grp.h>
#include <pwd.h>
#include <unistd.h>

#include <algorithm>
#include <cstdlib>
#include <vector>

#include "access/CommandDevice.h"

namespace vesprun {
namespace {

constexpr uid_t kRoot = 0;
constexpr gid_t kNoGroup = 65534;

/// The groups of a user; empty when the system does not know the user.
std::vector<gid_t> groupsOf(uid_t user) {
  const passwd* const entry = getpwuid(user);
  std::vector<gid_t> groups;
  if (entry != nullptr) {
    int count = 32;
    do {
      groups.resize(static_cast<std::size_t>(count));
    } while (getgrouplist(entry->pw_name, entry->pw_gid, groups.data(), &count) < 0);
    groups.resize(static_cast<std::size_t>(count));
    std::iter_swap(groups.begin(), std::ranges::find(groups, entry->pw_gid));
  }
  return groups;
}

}  // namespace

void takeRightsOfOwner(const struct stat& directory, OwnersRights rights) {
  const uid_t user = directory.st_uid;
  if (geteuid() != kRoot || user == kRoot) {
    return;
  }
  gid_t group = directory.st_gid;
  const std::vector<gid_t> groups = groupsOf(user);
  if (!groups.empty() && std::ranges::find(groups, group) == groups.end()) {
    group = groups.front();
  } else if (groups.empty() && group == kRoot) {
    group = kNoGroup;
  }
  const bool isForGood = rights == OwnersRights::ForGood;
  if (setgroups(groups.size(), groups.data()) != 0 ||
      setresgid(group, group, isForGood ? group : kRoot) != 0 ||
      setresuid(user, user, isForGood ? user : kRoot) != 0) {
    throw CommandFailure(systemError("the rights of " + nameOfUser(user) + " cannot be taken"));
  }
}

RightsOfCaller::RightsOfCaller() {
  uid_t realUser = 0;
  uid_t savedUser = 0;
  gid_t realGroup = 0;
  gid_t savedGroup = 0;
  getresuid(&realUser, &_user, &savedUser);
  getresgid(&realGroup, &_group, &savedGroup);
  if (seteuid(savedUser) != 0 || setegid(savedGroup) != 0) {
    throw CommandFailure(systemError("the rights of the start cannot be taken again"));
  }
}

RightsOfCaller::~RightsOfCaller() {
  if (setegid(_group) != 0 || seteuid(_user) != 0) {
    std::abort();
  }
}

std::string nameOfUser(uid_t user) {
  const passwd* const entry = getpwuid(user);
  return entry != nullptr ? entry->pw_name : "user " + std::to_string(user);
}

}  // namespace vesprun
