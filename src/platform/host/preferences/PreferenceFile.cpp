#include "platform/host/preferences/PreferenceFile.h"

#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <utility>

#include "platform/host/documents/PtreeReader.h"
#include "platform/host/documents/PtreeWriter.h"
#include "platform/host/files/AtomicFile.h"
#include "platform/host/files/FileLock.h"
#include "platform/host/files/Files.h"

namespace vesprun {

PreferenceFile::PreferenceFile(const DeviceDirectory& device, Clock& clock, SystemLog& log,
                               std::string folder, std::string_view domain,
                               std::chrono::milliseconds longestWait)
    : _device(device),
      _clock(clock),
      _log(log),
      _folder(std::move(folder)),
      _path(device.hostPath(_folder) + '/' + std::string(domain) + ".ptree"),
      _longestWait(longestWait) {}

PreferenceFile::Content PreferenceFile::read() const {
  Content content;
  bool missing = false;
  const std::optional<std::string> document = readWholeFile(_path, content.error, &missing);
  if (!document) {
    content.state = missing ? State::Missing : State::Unreadable;
    return content;
  }
  std::string error;
  std::optional<PropertyValue> root = readPtree(*document, error);
  if (root && root->dict() != nullptr) {
    content.state = State::Good;
    content.values = std::move(*root->dict());
  } else {
    content.state = State::Malformed;
    content.error = _path + ": " + (root ? "line 1: the root is not a dictionary" : error);
  }
  return content;
}

const PropertyDict& PreferenceFile::stored() {
  if (!_stored) {
    Content content = read();
    const bool faulty = content.state == State::Malformed || content.state == State::Unreadable;
    if (faulty && content.error != _reported) {
      _log.write(LogLevel::Error, content.error);
      _reported = content.error;
    }
    _stored = std::move(content.values);
  }
  return *_stored;
}

std::optional<PropertyValue> PreferenceFile::get(std::string_view key) {
  if (const auto change = _changes.find(std::string(key)); change != _changes.end()) {
    return change->second;
  }
  const PropertyValue* value = stored().find(key);
  return value != nullptr ? std::optional(*value) : std::nullopt;
}

PropertyDict PreferenceFile::values() {
  PropertyDict values = stored();
  applyChanges(values);
  return values;
}

void PreferenceFile::set(std::string_view key, std::optional<PropertyValue> value) {
  if (value) {
    std::string document;
    std::string error;
    if (!writePtree(PropertyDict{{std::string(key), *value}}, document, error)) {
      _log.write(LogLevel::Error, _path + ": " + error);
      return;
    }
  }
  _changes.insert_or_assign(std::string(key), std::move(value));
}

void PreferenceFile::applyChanges(PropertyDict& values) const {
  for (const auto& [key, value] : _changes) {
    if (value) {
      values.set(key, *value);
    } else {
      values.remove(key);
    }
  }
}

bool PreferenceFile::synchronize() {
  std::string error;
  if (!_changes.empty() && !writeChanges(error)) {
    _log.write(LogLevel::Error, error);
    return false;
  }
  _changes.clear();
  _stored.reset();
  return true;
}

bool PreferenceFile::writeChanges(std::string& error) {
  const std::optional<std::string> folder = _device.makeFolder(_folder, error);
  if (!folder) {
    return false;
  }
  const std::optional<FolderLock> lock =
      FolderLock::take(*folder, error, FolderLock::Kind::Exclusive, _longestWait);
  if (!lock) {
    return false;
  }
  Content content = read();
  if (content.state == State::Unreadable) {
    error = content.error;
    return false;
  }
  // Compared as documents, which also differ when only the kind of a number does.
  std::string before;
  std::string document;
  if (!writePtree(content.values, before, error)) {
    return false;
  }
  applyChanges(content.values);
  if (!writePtree(content.values, document, error)) {
    return false;
  }
  if (document == before) {
    return true;
  }
  if (content.state == State::Malformed && !keepAside(error)) {
    return false;
  }
  return replaceFile(_path, document, error);
}

bool PreferenceFile::keepAside(std::string& error) const {
  const std::string aside = nameAside(_path, "unreadable", _clock);
  constexpr int kMostInOneSecond = 1000;
  for (int number = 1; number <= kMostInOneSecond; ++number) {
    const std::string name = number == 1 ? aside : aside + '-' + std::to_string(number);
    // A second name never replaces a file, and the domain's file is never missing.
    if (link(_path.c_str(), name.c_str()) == 0) {
      _log.write(LogLevel::Error, _path + ": kept as " + name);
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
