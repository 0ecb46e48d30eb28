#include "config/TBConfig.h"

#include <cstdint>
#include <optional>
#include <utility>

#include "common/HexText.h"
#include "config/InternalDevice.h"
#include "config/WhitelistTables.h"
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

std::string hexadecimalDigest(std::string_view bytes) {
  std::string text;
  for (const std::uint8_t byte : platform().messageDigest().md5(bytes)) {
    appendHex(text, byte);
  }
  return text;
}

}  // namespace

std::unique_ptr<TBConfig> TBConfig::init() {
  std::unique_ptr<TBConfig> config(new TBConfig());
  config->_isInternalDevice = TBIsInternalDevice();
  const std::optional<std::string> bytes = readWhitelist();
  if (!bytes) {
    logMessage(LogLevel::Error, "Couldn't load whitelist");
    return nullptr;
  }
  config->_configFileDigest = hexadecimalDigest(*bytes);
  std::string error;
  const std::optional<PropertyValue> root = platform().ptreeSerialization().parse(*bytes, error);
  const PropertyDict* groups = root ? root->dict() : nullptr;
  if (groups == nullptr) {
    logMessage(LogLevel::Error, "Couldn't parse the contents of the config file. Error: %s",
               root ? "the root is not a dictionary" : error.c_str());
    return nullptr;
  }
  WhitelistTables tables = gatherWhitelistTables(*groups, config->_isInternalDevice);
  config->_scalarKeys = std::move(tables.scalarKeys);
  config->_scalarPrefixes = PrefixTable(std::move(tables.scalarPrefixes));
  config->_distributionKeys = std::move(tables.distributionKeys);
  config->_distributionPrefixes = PrefixTable(std::move(tables.distributionPrefixes));
  return config;
}

const PropertyDict* TBConfig::configOptionsForScalarKey(std::string_view key) const {
  return optionsForKey(key, _scalarKeys, _scalarPrefixes);
}

const PropertyDict* TBConfig::configOptionsForDistributionKey(std::string_view key) const {
  return optionsForKey(key, _distributionKeys, _distributionPrefixes);
}

const PropertyDict* TBConfig::optionsForKey(std::string_view key, const PropertyDict& exactKeys,
                                            const PrefixTable& prefixes) const {
  if (const PropertyValue* options = exactKeys.find(key)) {
    return options->dict();
  }
  if (const PrefixTable::Entry* entry = prefixes.find(key)) {
    const auto& [prefix, options] = *entry;
    logMessage(LogLevel::Debug, "prefix match %s for %s", prefix.c_str(), std::string(key).c_str());
    return options.dict();
  }
  if (_isInternalDevice) {
    static const PropertyDict kNoOptions;
    logMessage(LogLevel::Debug, "passing @{} for %s as device is Quill Internal",
               std::string(key).c_str());
    return &kNoOptions;
  }
  return nullptr;
}

}  // namespace vesprun
