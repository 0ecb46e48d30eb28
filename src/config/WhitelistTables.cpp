#include "config/WhitelistTables.h"

#include <cstddef>
#include <string>
#include <string_view>

#include "config/KeyOptions.h"
#include "platform/Platform.h"

namespace vesprun {
namespace {

constexpr std::string_view kTaskingDomain = "com.quill.da";

bool hasScalarOptions(const PropertyDict& options) {
  return readScalarOptions(options).has_value();
}

bool hasDistributionOptions(const PropertyDict& options) {
  return readDistributionOptions(options).has_value();
}

struct Table {
  std::string_view name;
  PropertyDict WhitelistTables::*entries;
  bool (*isReadable)(const PropertyDict& options);
};

constexpr Table kTables[] = {
    {"ScalarKeys", &WhitelistTables::scalarKeys, hasScalarOptions},
    {"DistributionKeys", &WhitelistTables::distributionKeys, hasDistributionOptions},
    {"ScalarKeyPrefixes", &WhitelistTables::scalarPrefixes, hasScalarOptions},
    {"DistributionKeyPrefixes", &WhitelistTables::distributionPrefixes, hasDistributionOptions},
};

const Table* tableNamed(std::string_view name) {
  for (const Table& table : kTables) {
    if (table.name == name) {
      return &table;
    }
  }
  return nullptr;
}

bool isGroupTaken(const std::string& name, bool isInternalDevice) {
  if (name == "InternalTesting" && !isInternalDevice) {
    return false;
  }
  bool found = false;
  const bool enabled =
      platform().preferences().LGSPreferencesGetBoolValue(name, kTaskingDomain, found);
  if (isInternalDevice || enabled || !found) {
    return true;
  }
  logMessage(LogLevel::Default, "keyGroup %s is disabled by tasking", name.c_str());
  return false;
}

void takeEntries(const std::string& group, const std::string& table, const PropertyDict& entries,
                 bool (*isReadable)(const PropertyDict&), PropertyDict& taken) {
  std::size_t unreadable = 0;
  std::string firstUnreadable;
  for (const auto& [key, options] : entries) {
    if (options.dict() != nullptr && isReadable(*options.dict())) {
      taken.set(key, options);
      continue;
    }
    taken.set(key, false);
    if (unreadable++ == 0) {
      firstUnreadable = key;
    }
  }
  if (unreadable > 0) {
    logMessage(LogLevel::Error,
               "Whitelist group %s: %s: options of %zu keys cannot be read, which are left out; "
               "the first is %s",
               group.c_str(), table.c_str(), unreadable, firstUnreadable.c_str());
  }
}

void takeGroup(const std::string& name, const PropertyDict& group, WhitelistTables& tables) {
  for (const auto& [tableName, entries] : group) {
    const Table* table = tableNamed(tableName);
    if (table == nullptr) {
      continue;
    }
    if (entries.dict() != nullptr) {
      takeEntries(name, tableName, *entries.dict(), table->isReadable, tables.*table->entries);
    } else {
      logMessage(LogLevel::Error, "Whitelist group %s: %s is not a dictionary and is skipped",
                 name.c_str(), tableName.c_str());
    }
  }
}

}  // namespace

WhitelistTables gatherWhitelistTables(const PropertyDict& groups, bool isInternalDevice) {
  WhitelistTables tables;
  for (const auto& [name, group] : groups) {
    if (!isGroupTaken(name, isInternalDevice)) {
      continue;
    }
    if (group.dict() != nullptr) {
      takeGroup(name, *group.dict(), tables);
    } else {
      logMessage(LogLevel::Error, "Whitelist group %s is not a dictionary and is skipped",
                 name.c_str());
    }
  }
  return tables;
}

}  // namespace vesprun
