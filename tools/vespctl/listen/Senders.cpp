#include "listen/Senders.h"

#include <pwd.h>
#include <sys/stat.h>

#include <algorithm>

#include "access/CommandDevice.h"
#include "platform/host/counters/HostTallybook.h"
#include "platform/host/documents/JsonForm.h"
#include "platform/host/documents/NumberText.h"
#include "platform/host/documents/QuotedText.h"
#include "platform/host/files/AtomicFile.h"

namespace vesprun {
namespace {

constexpr const char* kNoteFolder = "run";
constexpr const char* kNoteName = "counted-keys.json";

std::optional<uid_t> userOf(const std::string& nameOrNumber) {
  uid_t number = 0;
  if (parseWholeText(nameOrNumber, number)) {
    return number;
  }
  const passwd* const user = getpwnam(nameOrNumber.c_str());
  return user == nullptr ? std::nullopt : std::optional(user->pw_uid);
}

}  // namespace

Senders::Senders(HostPlatform& device) : _device(device), _owner(geteuid()) {
  struct stat status {};
  if (stat(device.directory().path().c_str(), &status) == 0) {
    _owner = status.st_uid;
  }
  for (const auto& [name, prefixes] : device.description().senders) {
    if (name == "*") {
      _prefixesOfOthers = prefixes;
    } else if (const std::optional<uid_t> user = userOf(name)) {
      _prefixesOfUsers.insert_or_assign(*user, prefixes);
    } else {
      device.systemLog().write(
          LogLevel::Default, "listen: device.json: senders: no user is named " + quotedText(name));
    }
  }
}

HostPath Senders::notePath() const {
  return _device.directory().hostPath(kNoteFolder).below(kNoteName);
}

void Senders::beginDay(std::int32_t day) {
  const std::scoped_lock guard(_mutex);
  _day = day;
  _senders.clear();
  _valuesOfDistributions.clear();
  _hasNewKeys = false;
  readNote();
  countValues();
}

/// What is malformed is passed over: a sender then begins from 0.
void Senders::readNote() {
  std::string error;
  bool isMissing = false;
  const auto content = readWholeFile(notePath(), error, &isMissing);
  if (!content && !isMissing) {
    throw CommandFailure(error);
  }
  const auto note = valueFromJsonText(content.value_or(""), error);
  const PropertyDict* const root = note ? note->dict() : nullptr;
  const PropertyValue* const day = root != nullptr ? root->find("day") : nullptr;
  const PropertyDict* const users = root != nullptr ? root->findDict("keys") : nullptr;
  if (day == nullptr || day->number() == nullptr || day->number()->asInt64() != _day ||
      users == nullptr) {
    return;
  }
  for (const auto& [number, keys] : *users) {
    uid_t user = 0;
    if (!parseWholeText(std::string_view(number), user) || keys.array() == nullptr) {
      continue;
    }
    Sender& sender = senderOf(user);
    for (const PropertyValue& key : *keys.array()) {
      if (key.string() != nullptr) {
        sender.keys.insert(*key.string());
      }
    }
  }
}

/// Damage is in the system log, and what comes before it counts.
void Senders::countValues() {
  std::vector<double> some(CounterStore::kSamplesPerChunk);
  const auto count = [&](std::string_view key, std::int32_t,
                         TBHistoryDistributionEnumerator& values, bool&) {
    std::int64_t& sum = _valuesOfDistributions[std::string(key)];
    while (const std::size_t more = values.getNextValues(some)) {
      sum += static_cast<std::int64_t>(more);
    }
  };
  _device.tallybook()
      .initWithDefaultPath()
      ->distributionsForKeyPrefixMinDaysSince1970MaxDaysSince1970RowHandler("", _day, _day, count);
}

Senders::Sender& Senders::senderOf(uid_t user) {
  const auto found = _senders.find(user);
  if (found != _senders.end()) {
    return found->second;
  }
  const bool ownsDevice = user == 0 || user == _owner;
  const auto own = _prefixesOfUsers.find(user);
  const Prefixes* const prefixes = ownsDevice                      ? nullptr
                                   : own != _prefixesOfUsers.end() ? &own->second
                                                                   : &_prefixesOfOthers;
  return _senders.insert({user, {prefixes, ownsDevice ? kMaxKeysOfOwner : kMaxKeys, {}}})
      .first->second;
}

std::optional<DropReason> Senders::admit(std::optional<uid_t> sender, const StatsdLine& line) {
  if (!sender) {
    return DropReason::Rights;
  }
  const std::scoped_lock guard(_mutex);
  Sender& counted = senderOf(*sender);
  const auto begins = [&line](const std::string& prefix) { return line.key.starts_with(prefix); };
  if (counted.prefixes != nullptr && std::ranges::none_of(*counted.prefixes, begins)) {
    return DropReason::Rights;
  }
  const bool isKnown = counted.keys.contains(line.key);
  if (!isKnown && counted.keys.size() >= counted.maxKeys) {
    return DropReason::Bounds;
  }
  if (line.change == StatsdLine::Change::Append) {
    const auto found = _valuesOfDistributions.find(line.key);
    std::int64_t& values = found != _valuesOfDistributions.end()
                               ? found->second
                               : _valuesOfDistributions[std::string(line.key)];
    const auto more = static_cast<std::int64_t>(line.numbers.size());
    if (values + more > kMaxValues) {
      return DropReason::Bounds;
    }
    values += more;
  }
  if (!isKnown) {
    counted.keys.emplace(line.key);
    _hasNewKeys = true;
  }
  return std::nullopt;
}

bool Senders::noteKeys(std::string& error) {
  PropertyDict users;
  std::int32_t day = 0;
  {
    const std::scoped_lock guard(_mutex);
    if (!_hasNewKeys) {
      return true;
    }
    day = _day;
    for (const auto& [user, sender] : _senders) {
      PropertyArray keys;
      for (const std::string& key : sender.keys) {
        keys.emplace_back(key);
      }
      users.set(std::to_string(user), std::move(keys));
    }
    _hasNewKeys = false;
  }
  const auto folder = _device.directory().makeFolder(kNoteFolder, error);
  const PropertyDict note{{"day", day}, {"keys", std::move(users)}};
  const bool done = folder && replaceFile(notePath(), jsonText(note) + '\n', error);
  if (!done) {
    const std::scoped_lock guard(_mutex);
    _hasNewKeys = true;
  }
  return done;
}

}  // namespace vesprun
