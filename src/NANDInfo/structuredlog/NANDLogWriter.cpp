#include "NANDInfo/structuredlog/NANDLogWriter.h"

#include <array>
#include <charconv>
#include <cmath>
#include <cstdio>
#include <exception>
#include <optional>
#include <utility>

#include "NANDInfo/sets/LegacyNANDInfo.h"
#include "NANDInfo/structuredlog/StructuredLogGlobals.h"
#include "common/Calendar.h"
#include "common/LittleEndian.h"
#include "common/TextForm.h"
#include "platform/DictionaryHelpers.h"
#include "platform/Platform.h"

namespace vesprun {
namespace {

constexpr std::string_view kLogType = "165";
constexpr std::string_view kLogName = "StorageStatus";
constexpr std::string_view kDefaultsDomain = "vesprun";
constexpr std::string_view kLastLoggedKey = "SSLastLoggedAt";
constexpr double kSecondsBetweenLogs = 604'800.0;

constexpr std::size_t kListCount = 16;

/// The validity list in 32-bit words: number of entries, number of pairs, the pairs, the entries.
class ValidityList {
 public:
  static constexpr std::uint64_t kWordSize = 4;
  static constexpr std::uint64_t kHeaderWords = 2;
  static constexpr std::uint64_t kWordsPerPair = 2;
  static constexpr std::uint64_t kWordsPerEntry = 5;

  /// Nothing without entries, or when the buffer does not hold all.
  static std::optional<ValidityList> read(std::span<const std::uint8_t> buffer) {
    if (buffer.size() < kHeaderWords * kWordSize) {
      return std::nullopt;
    }
    const std::uint64_t entries = loadLittleEndian<std::uint32_t>(buffer.data());
    const std::uint64_t pairs = loadLittleEndian<std::uint32_t>(buffer.data() + kWordSize);
    const std::uint64_t firstEntry = kHeaderWords + kWordsPerPair * pairs;
    const std::uint64_t words = firstEntry + kWordsPerEntry * entries;
    if (entries == 0 || buffer.size() < words * kWordSize) {
      return std::nullopt;
    }
    return ValidityList(buffer.subspan(firstEntry * kWordSize, entries * kEntrySize));
  }

  /// In buffer order.
  std::array<PropertyArray, kListCount> valuesByList() const {
    std::array<PropertyArray, kListCount> lists;
    for (std::size_t at = 0; at < _entries.size(); at += kEntrySize) {
      const auto list = loadLittleEndian<std::uint32_t>(_entries.data() + at + kWordSize);
      if (list < kListCount) {
        appendNumberValueForType(lists[list],
                                 static_cast<std::int32_t>(loadLittleEndian<std::uint32_t>(
                                     _entries.data() + at + 2 * kWordSize)));
      }
    }
    return lists;
  }

 private:
  static constexpr std::uint64_t kEntrySize = kWordsPerEntry * kWordSize;

  explicit ValidityList(std::span<const std::uint8_t> entries) : _entries(entries) {}

  std::span<const std::uint8_t> _entries;
};

/// Independent of the locale; NaN without a sign.
std::string twoDecimals(double value) {
  std::array<char, 512> text;  // a double has up to 309 digits before the point
  const double shown = std::isnan(value) ? std::fabs(value) : value;
  const auto [end, error] =
      std::to_chars(text.data(), text.data() + text.size(), shown, std::chars_format::fixed, 2);
  return {text.data(), end};
}

bool isNumber(const PropertyValue& value) {
  return value.number() != nullptr || value.boolean() != nullptr;
}

/// The elements joined by commas; nothing without a number among them.
std::optional<std::string> joinedElements(const PropertyArray& array) {
  std::string text;
  bool holdsNumber = false;
  for (const PropertyValue& element : array) {
    text += (&element == &array.front() ? "" : ",") + textForm(element);
    holdsNumber = holdsNumber || isNumber(element);
  }
  return holdsNumber ? std::optional(std::move(text)) : std::nullopt;
}

/// Nothing for a field that is left out.
std::optional<std::string> fieldText(const PropertyValue& value) {
  if (const Number* number = value.number(); number != nullptr && number->isFloatingPoint()) {
    return twoDecimals(number->asDouble());
  }
  if (isNumber(value)) {
    return textForm(value);
  }
  return value.array() != nullptr ? joinedElements(*value.array()) : std::nullopt;
}

std::string joinedFields(const PropertyDict& fields) {
  std::string items;
  for (const auto& [key, value] : fields) {
    if (const std::optional<std::string> text = fieldText(value)) {
      items += (items.empty() ? "" : ";") + key + ':' + *text;
    }
  }
  return items;
}

std::string logText(const std::string& date, const PropertyDict& fields) {
  DeviceInformation& device = platform().deviceInformation();
  std::string record = date + ' ' + device.processName();
  record += '[' + std::to_string(device.processIdentifier()) + "]: ";
  record += joinedFields(fields) + '\n';
  // One by one: a sum may ask in any order.
  std::string text = "System ID: " + device.GetSysIDWithDescription(false);
  text += "\nHardware Model: " + device.GetHardwareModel();
  text += "\nOS Version: " + device.GetSystemVersion();
  text += "\nDate: " + date;
  text += "\nIncident ID: " + device.GetIncidentID();
  text += "\nFaultline Key: " + GetFaultlineKey();
  return text + "\n\n" + record;
}

bool wasLoggedLately(const Date& now) {
  const std::optional<PropertyValue> stored =
      platform().preferences().LGSPreferencesGetValue(kLastLoggedKey, kDefaultsDomain);
  const Date* last = stored ? stored->date() : nullptr;
  if (last == nullptr || secondsBetween(*last, now) >= kSecondsBetweenLogs) {
    return false;
  }
  logMessage(LogLevel::Default, "NANDLogWriter:Last written at %s current %s :skipped",
             textForm(*last).c_str(), textForm(now).c_str());
  return true;
}

void submitLog(std::string_view logType, const PropertyDict& fields, const Date& now) {
  const std::string text = logText(platform().clock().localDateText(now), fields);
  // A failed submission counts: the next one is due in 7 days.
  platform().logsmith().LGSWriteLogForSubmission(
      logType, kLogName, nullptr, [&text](const LogFileHandle& write) { write(text); });
  platform().preferences().LGSPreferencesSetValue(kLastLoggedKey, now, kDefaultsDomain);
  platform().preferences().LGSPreferencesSynchronize(kDefaultsDomain);
}

}  // namespace

std::string GetFaultlineKey() {
  const std::optional<PropertyValue> answer =
      platform().deviceInformation().OrreryCopyAnswer("InverseDeviceID");
  return answer && answer->string() != nullptr ? *answer->string() : "error";
}

void NLW_WriteLog(std::string_view logType, const PropertyDict* fields) {
  const Date now = platform().clock().now();
  if (wasLoggedLately(now) || fields == nullptr) {
    return;
  }
  try {
    submitLog(logType, *fields, now);
  } catch (const std::exception& error) {
    logMessage(LogLevel::Error, "An exception occurred: %s", error.what());
  }
}

bool WriteValidityListNANDLog(std::span<const std::uint8_t> buffer,
                              const PropertyValue* /*properties*/, std::string_view /*className*/) {
  if (gNeedValidityList == 0) {
    return true;
  }
  const std::optional<ValidityList> list = ValidityList::read(buffer);
  if (!list) {
    std::fputs("data cannot be parsed", stderr);
    return false;
  }
  PropertyDict fields;
  setNumberValueForType(fields, "IntermediateWamp", gCurrentSysWamp);
  setNumberValueForType(fields, "UserWamp", gCurrentUserWamp);
  addNANDInfo(fields);
  int number = 0;
  for (PropertyArray& values : list->valuesByList()) {
    if (!values.empty()) {
      fields.set("ValidityList[" + std::to_string(number) + ']', std::move(values));
    }
    ++number;
  }
  NLW_WriteLog(kLogType, &fields);
  return true;
}

}  // namespace vesprun
