#include "config/TBConfig.h"

#include <cstdint>
#include <utility>
#include <vector>

#include "common/TextForm.h"
#include "config/InternalDevice.h"
#include "platform/Platform.h"

namespace vesprun {
namespace {

constexpr const char* kWhitelistPath =
    "/Library/Application Support/Tallybook/Whitelist_Stagebox.ptree";
constexpr std::uint64_t kMostBytes = 256 << 20;

std::optional<std::string> readWhitelist() {
  FileSystem& fileSystem = platform().fileSystem();
  if (fileSystem.fileSize(kWhitelistPath).value_or(0) > kMostBytes) {
    return std::nullopt;
  }
  return fileSystem.readFile(kWhitelistPath);
}

template <typename Options>
void takeList(const WhitelistKeyGroup& group, const std::string& list, const PropertyValue& entries,
              WhitelistTable<Options>& table) {
  if (entries.dict() == nullptr) {
    logMessage(LogLevel::Error, "Whitelist group %s: %s is not a dictionary and is skipped",
               group.name.c_str(), list.c_str());
    return;
  }
  for (const auto& [key, written] : *entries.dict()) {
    const PropertyDict* options = written.dict();
    table.insert_or_assign(
        key, WhitelistEntry<Options>{group.name,
                                     options != nullptr ? Options::read(*options) : std::nullopt});
  }
}

template <typename Options>
void reportHeldBack(const char* list, const WhitelistTable<Options>& table) {
  std::size_t count = 0;
  std::string first;
  for (const auto& [key, entry] : table) {
    if (!entry.options && count++ == 0) {
      first.append(key).append(" in group ").append(entry.group);
    }
  }
  if (count > 0) {
    logMessage(LogLevel::Error,
               "Whitelist: %s: options of %zu keys cannot be read, which are left out; the first "
               "is %s",
               list, count, first.c_str());
  }
}

template <typename Options>
PrefixTable prefixTableOf(const WhitelistTable<Options>& prefixes) {
  std::vector<std::string_view> texts;
  texts.reserve(prefixes.size());
  for (const auto& [prefix, entry] : prefixes) {
    texts.push_back(prefix);
  }
  return PrefixTable(texts);
}

template <typename Options>
WhitelistDecision<Options> decide(std::string_view key, const WhitelistTable<Options>& keys,
                                  const WhitelistTable<Options>& prefixes,
                                  const PrefixTable& prefixTable, bool isInternalDevice) {
  if (const auto named = keys.find(key); named != keys.end()) {
    return {DecidedBy::Key, {}, &named->second};
  }
  if (const std::optional<std::size_t> place = prefixTable.find(key)) {
    const auto& [prefix, entry] = *prefixes.nth(*place);
    return {DecidedBy::Prefix, prefix, &entry};
  }
  return {isInternalDevice ? DecidedBy::InternalDevice : DecidedBy::Nothing, {}, nullptr};
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
  const std::optional<std::string> bytes = readWhitelist();
  if (!bytes) {
    logMessage(LogLevel::Error, "Couldn't load whitelist");
    return nullptr;
  }
  return fromBytes(*bytes);
}

std::unique_ptr<TBConfig> TBConfig::fromBytes(std::string_view bytes) {
  std::string digest = hexadecimalText(platform().messageDigest().md5(bytes));
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
  reportHeldBack("ScalarKeys", _scalarKeys);
  reportHeldBack("DistributionKeys", _distributionKeys);
  reportHeldBack("ScalarKeyPrefixes", _scalarPrefixes);
  reportHeldBack("DistributionKeyPrefixes", _distributionPrefixes);
  _scalarPrefixTable = prefixTableOf(_scalarPrefixes);
  _distributionPrefixTable = prefixTableOf(_distributionPrefixes);
}

void TBConfig::takeGroup(const WhitelistKeyGroup& group) {
  if (group.lists.dict() == nullptr) {
    logMessage(LogLevel::Error, "Whitelist group %s is not a dictionary and is skipped",
               group.name.c_str());
    return;
  }
  for (const auto& [list, entries] : *group.lists.dict()) {
    if (list == "ScalarKeys") {
      takeList(group, list, entries, _scalarKeys);
    } else if (list == "ScalarKeyPrefixes") {
      takeList(group, list, entries, _scalarPrefixes);
    } else if (list == "DistributionKeys") {
      takeList(group, list, entries, _distributionKeys);
    } else if (list == "DistributionKeyPrefixes") {
      takeList(group, list, entries, _distributionPrefixes);
    }
  }
}

WhitelistDecision<ScalarOptions> TBConfig::decideScalarKey(std::string_view key) const {
  return decide(key, _scalarKeys, _scalarPrefixes, _scalarPrefixTable, _isInternalDevice);
}

WhitelistDecision<DistributionOptions> TBConfig::decideDistributionKey(std::string_view key) const {
  return decide(key, _distributionKeys, _distributionPrefixes, _distributionPrefixTable,
                _isInternalDevice);
}

const ScalarOptions* TBConfig::configOptionsForScalarKey(std::string_view key) const {
  return optionsOf(key, decideScalarKey(key));
}

const DistributionOptions* TBConfig::configOptionsForDistributionKey(std::string_view key) const {
  return optionsOf(key, decideDistributionKey(key));
}

}  // namespace vesprun
