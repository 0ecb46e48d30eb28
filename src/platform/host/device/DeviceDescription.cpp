#include "platform/host/device/DeviceDescription.h"

#include <algorithm>
#include <functional>
#include <string_view>

#include "common/Calendar.h"
#include "common/LittleEndian.h"
#include "platform/DeviceInformation.h"
#include "platform/host/documents/JsonForm.h"

namespace vesprun {
namespace {

/// Never leaves this file.
struct DescriptionError {
  std::string text;
};

class Field;

/// A plain value of the description and the path to it.
class Entry {
 public:
  Entry(const PropertyValue& value, std::string path) : _value(value), _path(std::move(path)) {}

  [[noreturn]] void fail(const std::string& problem) const {
    throw DescriptionError{_path.empty() ? problem : _path + ": " + problem};
  }

  const PropertyValue& value() const { return _value; }
  bool isNull() const { return _value.data() != nullptr; }

  /// The content, which must be of that type.
  template <typename T>
  const T& as(const T* (PropertyValue::*content)() const, const char* problem) const {
    const T* found = (_value.*content)();
    if (found == nullptr) {
      fail(problem);
    }
    return *found;
  }
  const PropertyDict& dict() const {
    return as<PropertyDict>(&PropertyValue::dict, "not a dictionary");
  }
  const std::string& text() const { return as(&PropertyValue::string, "not a string"); }

  Entry at(std::string_view name) const { return at(name, *dict().find(name)); }
  Entry at(std::string_view name, const PropertyValue& value) const {
    return {value, (_path.empty() ? "" : _path + '.').append(name)};
  }

  /// Calls `work` for each entry of a dictionary with free names.
  template <typename Work>
  void forEachNamed(Work work) const {
    for (const auto& [name, value] : dict()) {
      work(std::string(name), at(name, value));
    }
  }

  template <typename Work>
  void forEachElement(Work work) const {
    std::size_t index = 0;
    for (const PropertyValue& element : as(&PropertyValue::array, "not an array")) {
      work(Entry(element, _path + '[' + std::to_string(index++) + ']'));
    }
  }

  /// Reads a dictionary with these entries and no others.
  void fields(const std::vector<Field>& fields) const;

  /// With tagged objects resolved.
  PropertyValue resolved() const {
    std::string error;
    std::optional<PropertyValue> value = valueFromPlain(_value, error);
    if (!value) {
      fail(error);
    }
    return *std::move(value);
  }

 private:
  const PropertyValue& _value;
  std::string _path;
};

enum class Presence { Optional, Required };
constexpr Presence kRequired = Presence::Required;

/// A named entry and what reads it.
class Field {
 public:
  using Reader = std::function<void(const Entry&)>;

  Field(std::string_view name, Reader reader) : _name(name), _read(std::move(reader)) {}
  template <typename T>
  Field(std::string_view name, T& target, Presence presence = Presence::Optional)
      : _name(name),
        _presence(presence),
        _read([&target](const Entry& entry) { read(entry, target); }) {}
  Field(std::string_view name, std::initializer_list<Field> fields)
      : _name(name),
        _read([fields = std::vector(fields)](const Entry& entry) { entry.fields(fields); }) {}
  /// An entry that is read elsewhere.
  explicit Field(std::string_view name) : _name(name), _read([](const Entry&) {}) {}

  std::string_view name() const { return _name; }

  void readFrom(const Entry& dictionary) const {
    if (dictionary.dict().contains(_name)) {
      _read(dictionary.at(_name));
    } else if (_presence == Presence::Required) {
      dictionary.at(_name, false).fail("missing");
    }
  }

 private:
  std::string_view _name;
  Presence _presence = Presence::Optional;
  Reader _read;
};

void Entry::fields(const std::vector<Field>& fields) const {
  forEachNamed([&fields](const std::string& name, const Entry& entry) {
    if (std::ranges::find(fields, name, &Field::name) == fields.end()) {
      entry.fail("unknown entry");
    }
  });
  for (const Field& field : fields) {
    field.readFrom(*this);
  }
}

void read(const Entry& entry, bool& value) {
  value = entry.as(&PropertyValue::boolean, "not a boolean");
}

template <NumberType T>
void read(const Entry& entry, T& value) {
  const Number* number = entry.value().number();
  if (number == nullptr || number->isFloatingPoint()) {
    entry.fail("not an integer");
  }
  value = static_cast<T>(number->asUInt64());
  if (!(Number(value) == *number)) {
    entry.fail("out of range");
  }
}

void read(const Entry& entry, double& value) {
  value = entry.as(&PropertyValue::number, "not a number").asDouble();
}

void read(const Entry& entry, std::string& value) { value = entry.text(); }

void read(const Entry& entry, PropertyArray& value) {
  entry.forEachElement([&value](const Entry& element) { value.push_back(element.resolved()); });
}

void read(const Entry& entry, PropertyDict& value) {
  PropertyValue all = entry.resolved();
  if (all.dict() == nullptr) {
    entry.fail("not a dictionary");
  }
  value = std::move(*all.dict());
}

template <typename T>
void read(const Entry& entry, std::vector<T>& value) {
  entry.forEachElement([&value](const Entry& element) { read(element, value.emplace_back()); });
}

void read(const Entry& entry, std::set<std::string, std::less<>>& value) {
  entry.forEachElement([&value](const Entry& element) { value.insert(element.text()); });
}

template <typename T>
void read(const Entry& entry, std::optional<T>& value) {
  read(entry, value.emplace());
}

template <typename T>
void read(const Entry& entry, DescribedAnswer<T>& answer) {
  answer.emplace();
  if (!entry.isNull()) {
    read(entry, *answer);
  }
}

void read(const Entry& entry, LogLevel& level) {
  const auto* found = std::ranges::find(kLogLevelNames, entry.text());
  if (found == std::end(kLogLevelNames)) {
    entry.fail("not a log level (error, default, notice, info, debug)");
  }
  level = static_cast<LogLevel>(found - std::begin(kLogLevelNames));
}

void read(const Entry& entry, Date& clock) {
  const std::optional<Date> date = parseDateText(entry.text());
  if (!date) {
    entry.fail("not a date such as 2024-03-05T09:15:02Z");
  }
  clock = *date;
}

void read(const Entry& entry, FileSystemStatistics& volume) {
  entry.fields({{"blockSize", volume.blockSize, kRequired},
                {"blocks", volume.blocks, kRequired},
                {"available", volume.availableBlocks, kRequired}});
}

void read(const Entry& entry, ApplicationDescription& app) {
  entry.fields({{"bundle", app.bundle, kRequired}, {"user", app.user, kRequired}});
}

void read(const Entry& entry, DeviceDescription::Ticks& ticks) {
  entry.fields({{"value", ticks.value, kRequired},
                {"numerator", ticks.ratio.numerator, kRequired},
                {"denominator", ticks.ratio.denominator, kRequired}});
}

void read(const Entry& entry, KernelVariable& variable) {
  const PropertyValue value = entry.resolved();
  if (const std::string* text = value.string()) {
    variable = KernelVariable::text(*text);
    return;
  }
  if (const Bytes* data = value.data()) {
    variable.bytes = *data;
    return;
  }
  entry.fields({Field("u32"), Field("u64")});
  const bool isNarrow = entry.dict().contains("u32");
  if (isNarrow == entry.dict().contains("u64")) {
    entry.fail("neither a string nor one of u32, u64 and data");
  }
  std::uint32_t narrow = 0;
  std::uint64_t wide = 0;
  isNarrow ? read(entry.at("u32"), narrow) : read(entry.at("u64"), wide);
  appendLittleEndian(variable.bytes, narrow | wide, isNarrow ? sizeof narrow : sizeof wide);
}

void read(const Entry& entry, std::map<std::string, KernelVariable, std::less<>>& variables) {
  entry.forEachNamed([&variables](const std::string& name, const Entry& variable) {
    read(variable, variables[name]);
  });
}

void read(const Entry& entry, ChannelDescription& channel) {
  entry.fields({{"name", channel.name, kRequired},
                {"value", channel.value, kRequired},
                {"format", channel.format},
                {"categories", channel.categories}});
}

void read(const Entry& entry, UsageDescription& usage) {
  entry.fields({{"records", usage.records}, {"delaySeconds", usage.delaySeconds}});
  if (!(usage.delaySeconds >= 0.0)) {
    entry.at("delaySeconds").fail("negative");
  }
}

void read(const Entry& entry, TunnelAnswerDescription& answer) {
  entry.fields({{"opcode", answer.opcode, kRequired},
                {"argument", answer.argument},
                {"kind", answer.kind},
                {"file", answer.file},
                {"size", answer.size},
                {"length", answer.length},
                {"sizeError", answer.sizeError},
                {"dataError", answer.dataError}});
}

void read(const Entry& entry, ContentDeletionDescription& deletion) {
  entry.fields({{"value", deletion.value}, {"length", deletion.length}, {"error", deletion.error}});
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

void read(const Entry& entry, decltype(UserClientDescription::scalarMethods)& methods) {
  entry.forEachNamed([&methods](const std::string& number, const Entry& codes) {
    if (number.empty() || number.size() > 9 ||
        number.find_first_not_of("0123456789") != std::string::npos) {
      codes.fail("not a method number");
    }
    auto& answers = methods[static_cast<std::uint32_t>(std::stoul(number))];
    codes.forEachNamed([&answers](const std::string& name, const Entry& value) {
      read(value, answers[readFourCharacterCode(name, value)]);
    });
  });
}

void read(const Entry& entry, UserClientDescription& client) {
  entry.fields({{"openError", client.openError},
                {"closeError", client.closeError},
                {"tunnel", client.tunnel},
                {"contentDeletion", client.contentDeletion},
                {"scalarMethods", client.scalarMethods}});
}

void read(const Entry& entry, RegistryEntryDescription& described) {
  entry.fields({{"class", described.className, kRequired},
                {"conformsTo", described.conformsTo},
                {"matching", described.matching},
                {"properties", described.properties},
                {"children", described.children},
                {"userClient", described.userClient}});
}

void readDiskUsage(const Entry& entry, DescribedAnswer<PropertyDict>& answer) {
  answer.emplace();
  if (entry.isNull()) {
    return;
  }
  entry.fields({Field(kDiskUsageTotalDiskCapacity), Field(kDiskUsageTotalDataAvailable),
                Field(kDiskUsageAmountDataAvailable)});
  PropertyDict& usage = answer->emplace();
  entry.forEachNamed([&usage](const std::string& name, const Entry& value) {
    std::int64_t number = 0;
    read(value, number);
    usage.set(name, number);
  });
}

void readSenders(const Entry& entry, decltype(DeviceDescription::senders)& senders) {
  senders.clear();
  entry.forEachNamed([&senders](const std::string& user, const Entry& prefixes) {
    read(prefixes, senders[user]);
  });
}

void read(const Entry& entry, DeviceDescription& device) {
  entry.fields(
      {{"clock", device.clock},
       {"timeZone", device.timeZone},
       {"logLevel", device.logLevel},
       {"system",
        {{"buildVersion", device.system.buildVersion},
         {"osVersion", device.system.osVersion},
         {"systemVersion", device.system.systemVersion},
         {"hardwareModel", device.system.hardwareModel},
         {"systemID", device.system.systemID},
         {"incidentID", device.system.incidentID}}},
       {"properties",
        {{"InternalBuild", device.properties.internalBuild},
         {"DiskUsage",
          [&](const Entry& usage) { readDiskUsage(usage, device.properties.diskUsage); }},
         {"InverseDeviceID", device.properties.inverseDeviceID}}},
       {"userVolume", device.userVolume},
       {"submission", {{"enabled", device.submission.enabled}, {"fails", device.submission.fails}}},
       {"logBlacklist", device.logBlacklist},
       {"events",
        {{"available", device.events.available},
         {"used",
          [&](const Entry& used) {
            if (used.value() != PropertyValue(true)) {
              read(used, device.events.used);
            }
          }},
         {"fails", device.events.fails}}},
       {"apps", device.apps},
       {"languages",
        {{"preferred", device.languages.preferred},
         {"localizations", device.languages.localizations},
         {"country", device.languages.country}}},
       {"supportLibrary",
        {{"available", device.supportLibrary.available},
         {"missing", device.supportLibrary.missing}}},
       {"purgeable", device.purgeable},
       {"kernel",
        {{"pageSize", device.kernel.pageSize},
         {"ticks", device.kernel.ticks},
         {"variables", device.kernel.variables},
         {"snapshot", device.kernel.snapshotFile},
         {"eccError", device.kernel.eccError}}},
       {"registry", device.registry},
       {"channels",
        [&](const Entry& channels) {
          device.liveChannels = channels.value() == PropertyValue("live");
          if (!device.liveChannels) {
            read(channels, device.channels);
          }
        }},
       {"senders", [&](const Entry& senders) { readSenders(senders, device.senders); }},
       {"usage", device.usage}});
}

}  // namespace

std::optional<DeviceDescription> readDeviceDescription(const std::string& text,
                                                       std::string& error) {
  if (std::ranges::count_if(text, [](char c) { return c == ',' || c == '[' || c == '{'; }) >
      kMaxDescribedValues) {
    error = "more than 1,000,000 values";
    return std::nullopt;
  }
  const std::optional<PropertyValue> root = plainValueFromJsonText(text, error);
  if (!root) {
    return std::nullopt;
  }
  try {
    std::optional<DeviceDescription> device(std::in_place);
    read(Entry(*root, ""), *device);
    return device;
  } catch (const DescriptionError& descriptionError) {
    error = descriptionError.text;
    return std::nullopt;
  }
}

}  // namespace vesprun
