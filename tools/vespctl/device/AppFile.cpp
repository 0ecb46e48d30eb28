#include "device/AppFile.h"

#include "platform/host/documents/JsonForm.h"
#include "platform/host/documents/QuotedText.h"

namespace vesprun {
namespace {

constexpr std::string_view kUuidForm = "hhhhhhhh-hhhh-hhhh-hhhh-hhhhhhhhhhhh";

int digitValue(char digit) {
  return digit >= '0' && digit <= '9'   ? digit - '0'
         : digit >= 'A' && digit <= 'F' ? digit - 'A' + 10
         : digit >= 'a' && digit <= 'f' ? digit - 'a' + 10
                                        : -1;
}

std::optional<Bytes> uuidBytes(std::string_view text) {
  if (text.size() != kUuidForm.size()) {
    return std::nullopt;
  }
  Bytes bytes;
  int high = -1;
  for (std::size_t i = 0; i < text.size(); ++i) {
    const int digit = digitValue(text[i]);
    if (kUuidForm[i] == '-' ? text[i] != '-' : digit < 0) {
      return std::nullopt;
    }
    if (digit >= 0 && high < 0) {
      high = digit;
    } else if (digit >= 0) {
      bytes.push_back(static_cast<std::uint8_t>((high * 16) + digit));
      high = -1;
    }
  }
  return bytes;
}

/// The value for the message; nothing, with the expectation in `wanted`, for a wrong one.
std::optional<PropertyValue> messageValue(std::string_view name, const PropertyValue& value,
                                          std::string& wanted) {
  if (name == "bundle_id" || name == "version") {
    wanted = "not a string";
    return value.string() != nullptr ? std::optional(value) : std::nullopt;
  }
  if (name == "adam_id" || name == "arch") {
    wanted = "not a signed 64-bit integer";
    const Number* number = value.number();
    return number != nullptr && number->kind() == NumberKind::Int64 ? std::optional(value)
                                                                    : std::nullopt;
  }
  if (name == "uuid") {
    wanted = "not a UUID text such as 00112233-4455-6677-8899-AABBCCDDEEFF";
    std::optional<Bytes> bytes =
        value.string() != nullptr ? uuidBytes(*value.string()) : std::nullopt;
    return bytes ? std::optional<PropertyValue>(*std::move(bytes)) : std::nullopt;
  }
  wanted = "unknown entry";
  return std::nullopt;
}

}  // namespace

std::optional<PropertyArray> appDataFromJson(std::string_view json, std::string& error) {
  const std::optional<PropertyValue> value = valueFromJsonText(json, error);
  if (!value) {
    return std::nullopt;
  }
  if (value->array() == nullptr) {
    error = "not an array of app dictionaries";
    return std::nullopt;
  }
  PropertyArray apps;
  for (const PropertyValue& element : *value->array()) {
    const std::string place = "app " + std::to_string(apps.size() + 1) + ": ";
    if (element.dict() == nullptr) {
      error = place + "not a dictionary";
      return std::nullopt;
    }
    PropertyDict app;
    for (const auto& [name, entry] : *element.dict()) {
      std::string wanted;
      std::optional<PropertyValue> carried = messageValue(name, entry, wanted);
      if (!carried) {
        error = place + quotedText(name) + ": " + wanted;
        return std::nullopt;
      }
      app.set(name, *std::move(carried));
    }
    apps.emplace_back(std::move(app));
  }
  return apps;
}

}  // namespace vesprun
