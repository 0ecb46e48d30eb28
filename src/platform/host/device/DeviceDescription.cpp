#include "platform/host/device/DeviceDescription.h"

#include <algorithm>
#include <initializer_list>
#include <limits>
#include <nlohmann/json.hpp>
#include <string_view>

#include "common/Calendar.h"
#include "platform/host/documents/JsonForm.h"

namespace vesprun {
namespace {

using Json = nlohmann::ordered_json;

/// What is wrong with the description; caught before it leaves this file.
struct DescriptionError {
  std::string text;
};

/// One place of the description: the value found there, if any, and the path that leads to it.
class Entry {
 public:
  Entry(const Json* value, std::string path) : _value(value), _path(std::move(path)) {}

  bool isPresent() const { return _value != nullptr; }
  bool isNull() const { return isPresent() && _value->is_null(); }
  bool isTrue() const { return isPresent() && _value->is_boolean() && _value->get<bool>(); }
  explicit operator bool() const { return isPresent(); }

  [[noreturn]] void fail(const std::string& problem) const {
    throw DescriptionError{_path.empty() ? problem : _path + ": " + problem};
  }

  /// Requires a dictionary that has no other entries than these.
  void dictionaryOf(std::initializer_list<std::string_view> names) const {
    require(_value->is_object(), "not a dictionary");
    for (const auto& [name, value] : _value->items()) {
      if (std::find(names.begin(), names.end(), name) == names.end()) {
        Entry(nullptr, joined(name)).fail("unknown entry");
      }
    }
  }

  Entry operator[](const std::string& name) const {
    const auto found = _value->find(name);
    return {found != _value->end() ? &*found : nullptr, joined(name)};
  }

  Entry required(const std::string& name) const {
    const Entry entry = (*this)[name];
    if (!entry) {
      entry.fail("missing");
    }
    return entry;
  }

  std::vector<Entry> elements() const {
    require(_value->is_array(), "not an array");
    std::vector<Entry> elements;
    for (const Json& element : *_value) {
      elements.emplace_back(&element, _path + '[' + std::to_string(elements.size()) + ']');
    }
    return elements;
  }

  /// The entries of a dictionary whose names are free.
  std::vector<std::pair<std::string, Entry>> namedEntries() const {
    require(_value->is_object(), "not a dictionary");
    std::vector<std::pair<std::string, Entry>> entries;
    for (const auto& [name, value] : _value->items()) {
      entries.emplace_back(name, Entry(&value, joined(name)));
    }
    return entries;
  }

  std::string text() const {
    require(_value->is_string(), "not a string");
    return _value->get<std::string>();
  }

  bool boolean() const {
    require(_value->is_boolean(), "not a boolean");
    return _value->get<bool>();
  }

  template <typename T>
  T integer() const {
    require(_value->is_number_integer(), "not an integer");
    const bool negative = !_value->is_number_unsigned() && _value->get<std::int64_t>() < 0;
    const bool fits = negative ? std::is_signed_v<T> &&
                                     _value->get<std::int64_t>() >=
                                         static_cast<std::int64_t>(std::numeric_limits<T>::min())
                               : _value->get<std::uint64_t>() <=
                                     static_cast<std::uint64_t>(std::numeric_limits<T>::max());
    require(fits, "out of range");
    return negative ? static_cast<T>(_value->get<std::int64_t>())
                    : static_cast<T>(_value->get<std::uint64_t>());
  }

  double real() const {
    require(_value->is_number(), "not a number");
    return _value->get<double>();
  }

  std::vector<std::string> texts() const {
    std::vector<std::string> texts;
    for (const Entry& element : elements()) {
      texts.push_back(element.text());
    }
    return texts;
  }

  std::set<std::string, std::less<>> textSet() const {
    const std::vector<std::string> all = texts();
    return {all.begin(), all.end()};
  }

  PropertyValue value() const {
    std::string error;
    std::optional<PropertyValue> value = valueFromJson(*_value, error);
    require(value.has_value(), error);
    return *std::move(value);
  }

  PropertyDict propertyDict() const {
    PropertyValue all = value();
    require(all.dict() != nullptr, "not a dictionary");
    return std::move(*all.dict());
  }

  PropertyArray propertyArray() const {
    PropertyArray array;
    for (const Entry& element : elements()) {
      array.push_back(element.value());
    }
    return array;
  }

 private:
  std::string joined(const std::string& name) const {
    return _path.empty() ? name : _path + '.' + name;
  }
  void require(bool holds, const std::string& problem) const {
    if (!holds) {
      fail(problem);
    }
  }

  const Json* _value;
  std::string _path;
};

std::optional<std::string> optionalText(const Entry& entry) {
  return entry ? std::optional(entry.text()) : std::nullopt;
}

template <typename T>
void readInteger(const Entry& entry, T& value) {
  if (entry) {
    value = entry.integer<T>();
  }
}

template <typename T>
void readInteger(const Entry& entry, std::optional<T>& value) {
  if (entry) {
    value = entry.integer<T>();
  }
}

void readBoolean(const Entry& entry, bool& value) {
  if (entry) {
    value = entry.boolean();
  }
}

/// Reads an entry that may be absent or null with `read`.
template <typename T, typename Read>
void readAnswer(const Entry& entry, AnswerDescription<T>& answer, Read read) {
  answer.isNull = entry.isNull();
  if (entry && !entry.isNull()) {
    answer.value = read(entry);
  }
}

LogLevel readLogLevel(const Entry& entry) {
  static constexpr std::string_view kLevels[] = {"error", "default", "notice", "info", "debug"};
  const auto* level = std::find(std::begin(kLevels), std::end(kLevels), entry.text());
  if (level == std::end(kLevels)) {
    entry.fail("not a log level (error, default, notice, info, debug)");
  }
  return static_cast<LogLevel>(level - std::begin(kLevels));
}

Date readClock(const Entry& entry) {
  const std::optional<Date> date = parseDateText(entry.text());
  if (!date) {
    entry.fail("not a date such as 2024-03-05T09:15:02Z");
  }
  return *date;
}

SystemDescription readSystem(const Entry& entry) {
  entry.dictionaryOf(
      {"buildVersion", "osVersion", "systemVersion", "hardwareModel", "systemID", "incidentID"});
  return {optionalText(entry["buildVersion"]),  optionalText(entry["osVersion"]),
          optionalText(entry["systemVersion"]), optionalText(entry["hardwareModel"]),
          optionalText(entry["systemID"]),      optionalText(entry["incidentID"])};
}

DevicePropertyDescription readProperties(const Entry& entry) {
  entry.dictionaryOf({"InternalBuild", "DiskUsage", "InverseDeviceID"});
  DevicePropertyDescription properties;
  readBoolean(entry["InternalBuild"], properties.internalBuild);
  readAnswer(entry["DiskUsage"], properties.diskUsage, [](const Entry& usage) {
    PropertyDict answer;
    usage.dictionaryOf({"TotalDiskCapacity", "TotalDataAvailable", "AmountDataAvailable"});
    for (const auto& [name, value] : usage.namedEntries()) {
      answer.set(name, value.integer<std::int64_t>());
    }
    return answer;
  });
  properties.inverseDeviceID = optionalText(entry["InverseDeviceID"]);
  return properties;
}

FileSystemStatistics readVolume(const Entry& entry) {
  entry.dictionaryOf({"blockSize", "blocks", "available"});
  return {entry.required("blockSize").integer<std::uint32_t>(),
          entry.required("blocks").integer<std::uint64_t>(),
          entry.required("available").integer<std::uint64_t>()};
}

EventHubDescription readEvents(const Entry& entry) {
  entry.dictionaryOf({"available", "used", "fails"});
  EventHubDescription events;
  readBoolean(entry["available"], events.available);
  if (const Entry used = entry["used"]) {
    if (!used.isTrue()) {  // `true` says what an absent entry says: every event is wanted
      events.used = used.textSet();
    }
  }
  if (const Entry fails = entry["fails"]) {
    events.fails = fails.textSet();
  }
  return events;
}

std::vector<ApplicationDescription> readApps(const Entry& entry) {
  std::vector<ApplicationDescription> apps;
  for (const Entry& app : entry.elements()) {
    app.dictionaryOf({"bundle", "user"});
    apps.push_back({app.required("bundle").text(), app.required("user").boolean()});
  }
  return apps;
}

LanguageDescription readLanguages(const Entry& entry) {
  entry.dictionaryOf({"preferred", "localizations", "country"});
  LanguageDescription languages;
  if (const Entry preferred = entry["preferred"]) {
    languages.preferred = preferred.texts();
  }
  if (const Entry localizations = entry["localizations"]) {
    languages.localizations = localizations.texts();
  }
  readAnswer(entry["country"], languages.country, [](const Entry& name) { return name.text(); });
  return languages;
}

KernelVariable readKernelVariable(const Entry& entry) {
  const PropertyValue value = entry.value();
  if (value.string() != nullptr) {
    return *value.string();
  }
  if (value.data() != nullptr) {
    return *value.data();
  }
  entry.dictionaryOf({"u32", "u64"});
  if (entry["u32"] && !entry["u64"]) {
    return entry["u32"].integer<std::uint32_t>();
  }
  if (!entry["u64"] || entry["u32"]) {
    entry.fail("neither a string nor one of u32, u64 and data");
  }
  return entry["u64"].integer<std::uint64_t>();
}

KernelDescription readKernel(const Entry& entry) {
  entry.dictionaryOf({"pageSize", "ticks", "variables", "snapshot", "eccError"});
  KernelDescription kernel;
  readInteger(entry["pageSize"], kernel.pageSize);
  readAnswer(entry["ticks"], kernel.ticks, [](const Entry& ticks) {
    ticks.dictionaryOf({"value", "numerator", "denominator"});
    return KernelDescription::Ticks{ticks.required("value").integer<std::uint64_t>(),
                                    {ticks.required("numerator").integer<std::uint32_t>(),
                                     ticks.required("denominator").integer<std::uint32_t>()}};
  });
  if (const Entry variables = entry["variables"]) {
    for (const auto& [name, variable] : variables.namedEntries()) {
      kernel.variables[name] = readKernelVariable(variable);
    }
  }
  kernel.snapshotFile = optionalText(entry["snapshot"]);
  readInteger(entry["eccError"], kernel.eccError);
  return kernel;
}

std::vector<ChannelDescription> readChannels(const Entry& entry) {
  std::vector<ChannelDescription> channels;
  for (const Entry& element : entry.elements()) {
    element.dictionaryOf({"name", "value", "format", "categories"});
    ChannelDescription channel{element.required("name").text(),
                               element.required("value").integer<std::int64_t>()};
    readInteger(element["format"], channel.format);
    readInteger(element["categories"], channel.categories);
    channels.push_back(std::move(channel));
  }
  return channels;
}

UsageDescription readUsage(const Entry& entry) {
  entry.dictionaryOf({"records", "delaySeconds"});
  UsageDescription usage;
  if (const Entry records = entry["records"]) {
    usage.records = records.propertyArray();
  }
  if (const Entry delay = entry["delaySeconds"]) {
    usage.delaySeconds = delay.real();
    if (!(usage.delaySeconds >= 0.0)) {
      delay.fail("negative");
    }
  }
  return usage;
}

/// "LPEM" is 0x4C50454D: the first character is the most significant byte.
std::uint32_t readFourCharacterCode(const std::string& name, const Entry& entry) {
  if (name.size() != 4) {
    entry.fail("not a four-character code");
  }
  std::uint32_t code = 0;
  for (const char c : name) {
    code = code << 8 | static_cast<unsigned char>(c);
  }
  return code;
}

UserClientDescription readUserClient(const Entry& entry) {
  entry.dictionaryOf({"openError", "closeError", "tunnel", "contentDeletion", "scalarMethods"});
  UserClientDescription client;
  readInteger(entry["openError"], client.openError);
  readInteger(entry["closeError"], client.closeError);
  if (const Entry tunnel = entry["tunnel"]) {
    for (const Entry& element : tunnel.elements()) {
      element.dictionaryOf(
          {"opcode", "argument", "kind", "file", "size", "length", "sizeError", "dataError"});
      TunnelAnswerDescription answer{element.required("opcode").integer<std::uint32_t>()};
      readInteger(element["argument"], answer.argument);
      readInteger(element["kind"], answer.kind);
      answer.file = optionalText(element["file"]);
      readInteger(element["size"], answer.size);
      readInteger(element["length"], answer.length);
      readInteger(element["sizeError"], answer.sizeError);
      readInteger(element["dataError"], answer.dataError);
      client.tunnel.push_back(std::move(answer));
    }
  }
  if (const Entry deletion = entry["contentDeletion"]) {
    deletion.dictionaryOf({"value", "length", "error"});
    client.contentDeletion.emplace();
    readInteger(deletion["value"], client.contentDeletion->value);
    readInteger(deletion["length"], client.contentDeletion->length);
    readInteger(deletion["error"], client.contentDeletion->error);
  }
  if (const Entry methods = entry["scalarMethods"]) {
    for (const auto& [number, codes] : methods.namedEntries()) {
      if (number.empty() || number.size() > 9 ||
          number.find_first_not_of("0123456789") != std::string::npos) {
        codes.fail("not a method number");
      }
      auto& answers = client.scalarMethods[static_cast<std::uint32_t>(std::stoul(number))];
      for (const auto& [name, value] : codes.namedEntries()) {
        answers[readFourCharacterCode(name, value)] = value.integer<std::uint64_t>();
      }
    }
  }
  return client;
}

std::vector<RegistryEntryDescription> readRegistry(const Entry& entry) {
  std::vector<RegistryEntryDescription> entries;
  for (const Entry& element : entry.elements()) {
    element.dictionaryOf(
        {"class", "conformsTo", "matching", "properties", "children", "userClient"});
    RegistryEntryDescription& described = entries.emplace_back();
    described.className = element.required("class").text();
    if (const Entry conformsTo = element["conformsTo"]) {
      described.conformsTo = conformsTo.texts();
    }
    readBoolean(element["matching"], described.matching);
    if (const Entry properties = element["properties"]) {
      described.properties = properties.propertyDict();
    }
    if (const Entry children = element["children"]) {
      described.children = readRegistry(children);
    }
    if (const Entry userClient = element["userClient"]) {
      described.userClient = readUserClient(userClient);
    }
  }
  return entries;
}

DeviceDescription readDevice(const Entry& root) {
  root.dictionaryOf({"clock", "timeZone", "logLevel", "system", "properties", "userVolume",
                     "submission", "logBlacklist", "events", "apps", "languages", "supportLibrary",
                     "purgeable", "kernel", "registry", "channels", "usage"});
  DeviceDescription device;
  if (const Entry clock = root["clock"]) {
    device.clock = readClock(clock);
  }
  device.timeZone = optionalText(root["timeZone"]);
  if (const Entry level = root["logLevel"]) {
    device.logLevel = readLogLevel(level);
  }
  if (const Entry system = root["system"]) {
    device.system = readSystem(system);
  }
  if (const Entry properties = root["properties"]) {
    device.properties = readProperties(properties);
  }
  readAnswer(root["userVolume"], device.userVolume, readVolume);
  if (const Entry submission = root["submission"]) {
    submission.dictionaryOf({"enabled", "fails"});
    readBoolean(submission["enabled"], device.submission.enabled);
    readBoolean(submission["fails"], device.submission.fails);
  }
  if (const Entry blacklist = root["logBlacklist"]) {
    device.logBlacklist = blacklist.propertyArray();
  }
  if (const Entry events = root["events"]) {
    device.events = readEvents(events);
  }
  if (const Entry apps = root["apps"]) {
    device.apps = readApps(apps);
  }
  if (const Entry languages = root["languages"]) {
    device.languages = readLanguages(languages);
  }
  if (const Entry library = root["supportLibrary"]) {
    library.dictionaryOf({"available", "missing"});
    readBoolean(library["available"], device.supportLibrary.available);
    if (const Entry missing = library["missing"]) {
      device.supportLibrary.missing = missing.textSet();
    }
  }
  if (const Entry purgeable = root["purgeable"]) {
    device.purgeableServiceAvailable = true;
    if (!purgeable.isNull()) {
      device.purgeable = purgeable.propertyDict();
    }
  }
  if (const Entry kernel = root["kernel"]) {
    device.kernel = readKernel(kernel);
  }
  if (const Entry registry = root["registry"]) {
    device.registry = readRegistry(registry);
  }
  if (const Entry channels = root["channels"]) {
    device.channels = readChannels(channels);
  }
  readAnswer(root["usage"], device.usage, readUsage);
  return device;
}

}  // namespace

std::optional<DeviceDescription> readDeviceDescription(const std::string& text,
                                                       std::string& error) {
  const std::optional<Json> root = jsonFromText(text, error);
  if (!root) {
    return std::nullopt;
  }
  try {
    return readDevice(Entry(&*root, ""));
  } catch (const DescriptionError& descriptionError) {
    error = descriptionError.text;
    return std::nullopt;
  }
}

}  // namespace vesprun
