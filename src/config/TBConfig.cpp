#include "config/TBConfig.h"

#include <cstdint>
#include <optional>
#include <utility>

#include "common/ProcessState.h"
#include "common/TextForm.h"
#include "platform/Platform.h"

namespace vesprun {
namespace {

constexpr std::uint64_t kMaxBytes = 256 << 20;

std::optional<bool> gIsInternalDevice;
const ProcessState kInternalDeviceState([] { gIsInternalDevice.reset(); });

/// The platform is asked once in a process.
bool TBIsInternalDevice() {
  if (!gIsInternalDevice) {
    gIsInternalDevice = platform().deviceInformation().OrreryGetBoolAnswer("InternalBuild");
  }
  return *gIsInternalDevice;
}

std::optional<std::string> readWhitelist() {
  FileSystem& fileSystem = platform().fileSystem();
  const std::string path = TBConfig::path();
  if (fileSystem.fileSize(path).value_or(0) > kMaxBytes) {
    return std::nullopt;
  }
  return fileSystem.readFile(path);
}

template <typename Entries>
void reportHeldBack(std::string_view list, const Entries& entries) {
  std::size_t count = 0;
  std::string first;
  for (const auto& [key, entry] : entries) {
    if (!entry.options && count++ == 0) {
      first.append(key).append(" in group ").append(*entry.group);
    }
  }
  if (count > 0) {
    logMessage(LogLevel::Error,
               "Whitelist: %s: options of %zu keys cannot be read, which are left out; the first "
               "is %s",
               list.data(), count, first.c_str());
  }
}

template <typename Options>
void reportUnread(std::string_view list, const typename WhitelistTable<Options>::Entries& entries) {
  std::size_t count = 0;
  const WhitelistEntry<Options>* first = nullptr;
  std::string_view firstKey;
  for (const auto& [key, entry] : entries) {
    if (!entry.hasUnread) {
      continue;
    }
    ++count;
    if (first == nullptr || entry.place < first->place) {
      first = &entry;
      firstKey = key;
    }
  }
  if (count > 0) {
    logMessage(LogLevel::Error,
               "Whitelist: %s: %zu keys have options that nothing reads, so they leave as if these "
               "were not there; the first is %s in group %s with %s",
               list.data(), count, std::string(firstKey).c_str(), first->group->c_str(),
               unreadOption<Options>(*first->written->dict())->c_str());
  }
}

template <typename Options>
const Options* optionsOf(std::string_view key, const WhitelistDecision<Options>& decision) {
  const auto length = [](std::string_view text) { return static_cast<int>(text.size()); };
  if (decision.by == DecidedBy::Prefix) {
    logMessage(LogLevel::Debug, "prefix match %.*s for %.*s", length(decision.prefix),
               decision.prefix.data(), length(key), key.data());
  } else if (decision.by == DecidedBy::InternalDevice) {
    logMessage(LogLevel::Debug, "passing @{} for %.*s as device is Quill Internal", length(key),
               key.data());
  }
  return decision.options();
}

}  // namespace

std::unique_ptr<TBConfig> TBConfig::init() {
  TBIsInternalDevice();  // asked before the file is read, whether there is one or not
  const std::optional<std::string> bytes = readWhitelist();
  if (!bytes) {
    logMessage(LogLevel::Error, "Couldn't load whitelist");
    return nullptr;
  }
  return fromBytes(*bytes);
}

std::unique_ptr<TBConfig> TBConfig::fromBytes(std::string_view bytes) {
  std::string digest = hexadecimalText(platform().ptreeSerialization().md5(bytes));
  std::string error;
  std::optional<PropertyValue> root = platform().ptreeSerialization().parse(bytes, error);
  if (!root || root->dict() == nullptr) {
    logMessage(LogLevel::Error, "Couldn't parse the contents of the config file. Error: %s",
               root ? "the root is not a dictionary" : error.c_str());
    return nullptr;
  }
  std::unique_ptr<TBConfig> config(new TBConfig(*std::move(root)));
  config->_configFileDigest = std::move(digest);
  return config;
}

TBConfig::TBConfig(PropertyValue document)
    : _document(std::move(document)), _isInternalDevice(TBIsInternalDevice()) {
  for (const auto& [name, lists] : *std::as_const(_document).dict()) {
    const WhitelistKeyGroup group{name, lists};
    switch (group.standing(_isInternalDevice)) {
      case WhitelistKeyGroup::Standing::Taken:
        takeGroup(group);
        break;
      case WhitelistKeyGroup::Standing::InternalDevicesOnly:
        break;
      case WhitelistKeyGroup::Standing::DisabledByTasking:
        logMessage(LogLevel::Default, "keyGroup %s is disabled by tasking", name.c_str());
        break;
    }
  }
  // After the last group: a later one may name a key again, with options that can be read.
  const auto& scalars = _tables.of<ScalarOptions>();
  const auto& distributions = _tables.of<DistributionOptions>();
  reportHeldBack(ScalarOptions::kKeyList, scalars.keys());
  reportHeldBack(DistributionOptions::kKeyList, distributions.keys());
  reportHeldBack(ScalarOptions::kPrefixList, scalars.prefixes());
  reportHeldBack(DistributionOptions::kPrefixList, distributions.prefixes());
  reportUnread<ScalarOptions>(ScalarOptions::kKeyList, scalars.keys());
  reportUnread<DistributionOptions>(DistributionOptions::kKeyList, distributions.keys());
  reportUnread<ScalarOptions>(ScalarOptions::kPrefixList, scalars.prefixes());
  reportUnread<DistributionOptions>(DistributionOptions::kPrefixList, distributions.prefixes());
}

void TBConfig::takeGroup(const WhitelistKeyGroup& group) {
  if (group.lists.dict() == nullptr) {
    logMessage(LogLevel::Error, "Whitelist group %s is not a dictionary and is skipped",
               group.name.c_str());
    return;
  }
  for (const std::string_view list : _tables.take(group)) {
    logMessage(LogLevel::Error, "Whitelist group %s: %s is not a dictionary and is skipped",
               group.name.c_str(), list.data());
  }
}

template <typename Options>
std::vector<PassedOverGroup> TBConfig::groupsPassedOver(std::string_view key) const {
  std::vector<PassedOverGroup> groups;
  for (const auto& [name, lists] : *_document.dict()) {
    const WhitelistKeyGroup group{name, lists};
    const auto standing = group.standing(_isInternalDevice);
    if (standing == WhitelistKeyGroup::Standing::Taken || lists.dict() == nullptr) {
      continue;
    }
    WhitelistTables ofGroup;
    ofGroup.take(group);
    if (const DecidedBy by = ofGroup.of<Options>().decide(key).by; by != DecidedBy::Nothing) {
      groups.push_back({name, standing, by});
    }
  }
  return groups;
}

template std::vector<PassedOverGroup> TBConfig::groupsPassedOver<ScalarOptions>(
    std::string_view) const;
template std::vector<PassedOverGroup> TBConfig::groupsPassedOver<DistributionOptions>(
    std::string_view) const;

const ScalarOptions* TBConfig::configOptionsForScalarKey(std::string_view key) const {
  return optionsOf(key, decide<ScalarOptions>(key));
}

const DistributionOptions* TBConfig::configOptionsForDistributionKey(std::string_view key) const {
  return optionsOf(key, decide<DistributionOptions>(key));
}

}  // namespace vesprun
