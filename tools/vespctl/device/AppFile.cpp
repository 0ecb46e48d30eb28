#include "device/AppFile.h"

#include <charconv>

#include "platform/host/documents/JsonForm.h"
#include "platform/host/documents/QuotedText.h"

namespace vesprun {
namespace {

std::optional<Bytes> uuidBytes(std::string_view text) {
  constexpr std::string_view kForm = "hhhhhhhh-hhhh-hhhh-hhhh-hhhhhhhhhhhh";
  Bytes bytes;
  for (std::size_t i = 0; i < kForm.size() && text.size() == kForm.size(); i += 2) {
    if (kForm[i] == '-' && text[i++] != '-') {
      return std::nullopt;
    }
    const char* const end = text.data() + i + 2;
    if (std::from_chars(text.data() + i, end, bytes.emplace_back(), 16).ptr != end) {
      return std::nullopt;
    }
  }
  return bytes.empty() ? std::nullopt : std::optional(std::move(bytes));
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
