#include "platform/host/preferences/HostPreferences.h"

#include <unistd.h>

#include <cerrno>
#include <utility>

#include "platform/Guarded.h"
#include "platform/host/documents/PtreeReader.h"
#include "platform/host/documents/PtreeWriter.h"
#include "platform/host/documents/QuotedText.h"
#include "platform/host/files/AtomicFile.h"

namespace vesprun {
namespace {

bool isPartOfPath(std::string_view name) {
  return !name.empty() && name.front() != '.' && name.find('/') == std::string_view::npos &&
         name.find('\0') == std::string_view::npos;
}

}  // namespace

HostPreferences::HostPreferences(const DeviceDirectory& device, Clock& clock, SystemLog& log,
                                 std::string_view user, std::chrono::milliseconds longestWait)
    : _device(device), _clock(clock), _log(log), _longestWait(longestWait) {
  if (isPartOfPath(user)) {
    _folder = "var/" + std::string(user) + "/Library/Preferences";
  } else {
    _log.write(LogLevel::Error, quotedText(user) + " cannot be the name of a user");
  }
}

HostPreferences::HostPreferences(const DeviceDirectory& device, Clock& clock, SystemLog& log,
                                 PreferenceFolder folder)
    : _device(device), _clock(clock), _log(log), _folder(std::move(folder.path)) {}

HostPreferences::~HostPreferences() {
  for (auto& [name, domain] : _domains) {
    runGuarded(_log, "preferences", [this, &changed = domain] { synchronize(changed); });
  }
}

HostPreferences::Domain* HostPreferences::find(std::string_view domain) {
  if (const auto known = _domains.find(domain); known != _domains.end()) {
    return &known->second;
  }
  if (_folder.empty()) {
    return nullptr;
  }
  if (!isPartOfPath(domain)) {
    if (_refused.emplace(domain).second) {
      _log.write(LogLevel::Error, quotedText(domain) + " cannot be the name of a domain");
    }
    return nullptr;
  }
  const std::string name(domain);
  return &_domains.emplace(name, Domain{_device.hostPath(_folder + '/' + name + ".ptree")})
              .first->second;
}

std::optional<PropertyValue> HostPreferences::LGSPreferencesGetValue(std::string_view key,
                                                                     std::string_view domain) {
  const std::scoped_lock guard(_mutex);
  Domain* found = find(domain);
  if (found == nullptr) {
    return std::nullopt;
  }
  if (const auto change = found->changes.find(std::string(key)); change != found->changes.end()) {
    return change->second;
  }
  const PropertyValue* value = stored(*found).find(key);
  return value != nullptr ? std::optional(*value) : std::nullopt;
}

void HostPreferences::LGSPreferencesSetValue(std::optional<std::string_view> key,
                                             std::optional<PropertyValue> value,
                                             std::string_view domain) {
  const std::scoped_lock guard(_mutex);
  Domain* found = find(domain);
  if (found == nullptr) {
    return;
  }
  if (!key) {
    _log.write(LogLevel::Error, "no key to change in domain " + quotedText(domain));
    return;
  }
  std::string error;
  if (value && !isPtree({PropertyDict{{std::string(*key), *value}}}, error)) {
    _log.write(LogLevel::Error, found->path.string() + ": " + error);
    return;
  }
  found->changes.insert_or_assign(std::string(*key), std::move(value));
}

bool HostPreferences::LGSPreferencesSynchronize(std::string_view domain) {
  const std::scoped_lock guard(_mutex);
  Domain* found = find(domain);
  return found != nullptr && synchronize(*found);
}

PropertyDict HostPreferences::valuesOfDomain(std::string_view domain) {
  const std::scoped_lock guard(_mutex);
  Domain* found = find(domain);
  PropertyDict values;
  if (found != nullptr) {
    values = stored(*found);
    found->applyChanges(values);
  }
  return values;
}

HostPreferences::Content HostPreferences::Domain::read() const {
  Content content;
  bool missing = false;
  const std::optional<std::string> document = readWholeFile(path, content.error, &missing);
  if (missing) {
    content.error.clear();
  }
  if (!document) {
    return content;
  }
  std::string error;
  std::optional<PropertyValue> root = readPtree(*document, error);
  if (root && root->dict() != nullptr) {
    content.values = std::move(*root->dict());
  } else {
    content.isMalformed = true;
    content.error = path.string() + ": " + (root ? "line 1: the root is not a dictionary" : error);
  }
  return content;
}

void HostPreferences::Domain::applyChanges(PropertyDict& values) const {
  for (const auto& [key, value] : changes) {
    if (value) {
      values.set(key, *value);
    } else {
      values.remove(key);
    }
  }
}

const PropertyDict& HostPreferences::stored(Domain& domain) {
  if (!domain.stored) {
    Content content = domain.read();
    if (!content.error.empty() && content.error != domain.reported) {
      _log.write(LogLevel::Error, content.error);
      domain.reported = content.error;
    }
    domain.stored = std::move(content.values);
  }
  return *domain.stored;
}

bool HostPreferences::synchronize(Domain& domain) {
  std::string error;
  if (!domain.changes.empty() && !writeChanges(domain, error)) {
    _log.write(LogLevel::Error, error);
    return false;
  }
  domain.changes.clear();
  domain.stored.reset();
  return true;
}

bool HostPreferences::writeChanges(const Domain& domain, std::string& error) {
  const std::optional<HostPath> folder = _device.makeFolder(_folder, error);
  if (!folder) {
    return false;
  }
  const std::optional<FileDescriptor> lock = lockFolder(*folder, error, LOCK_EX, _longestWait);
  if (!lock) {
    return false;
  }
  Content content = domain.read();
  if (!content.error.empty() && !content.isMalformed) {
    error = content.error;
    return false;
  }
  // Compared as documents, which also differ when only the kind of a number does.
  std::string before;
  std::string document;
  if (!writePtree(content.values, before, error)) {
    return false;
  }
  domain.applyChanges(content.values);
  if (!writePtree(content.values, document, error)) {
    return false;
  }
  if (document == before) {
    return true;
  }
  if (content.isMalformed && !keepAside(domain.path, lock->get(), error)) {
    return false;
  }
  return replaceFile(domain.path, document, error);
}

bool HostPreferences::keepAside(const HostPath& path, int folder, std::string& error) {
  const std::string aside = nameAside(path, "unreadable", _clock);
  constexpr int kMaxInOneSecond = 1000;
  for (int number = 1; number <= kMaxInOneSecond; ++number) {
    const std::string name = number == 1 ? aside : aside + '-' + std::to_string(number);
    // A second name never replaces a file, and the domain's file is never missing.
    if (linkat(folder, path.name().c_str(), folder, HostPath(name).name().c_str(), 0) == 0) {
      _log.write(LogLevel::Error, path.string() + ": kept as " + name);
      return true;
    }
    if (errno != EEXIST) {
      error = systemError(name);
      return false;
    }
  }
  error = aside + ": too many of them";
  return false;
}

}  // namespace vesprun
