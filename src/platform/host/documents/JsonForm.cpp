#include "platform/host/documents/JsonForm.h"

#include <algorithm>
#include <charconv>
#include <cmath>
#include <cstdint>
#include <limits>
#include <nlohmann/json.hpp>
#include <string_view>
#include <utility>
#include <vector>

#include "common/Calendar.h"
#include "platform/host/documents/Base64.h"
#include "platform/host/documents/NestedPlace.h"
#include "platform/host/documents/QuotedText.h"

namespace vesprun {
namespace {

using Json = nlohmann::ordered_json;

Json tagged(const char* name, Json content) {
  Json object = Json::object();
  object.emplace(name, std::move(content));
  return object;
}

Json jsonOf(const Number& number) {
  if (!number.isFloatingPoint()) {
    return number.isSigned() ? Json(number.asInt64()) : Json(number.asUInt64());
  }
  const double real = number.asDouble();
  if (!std::isfinite(real)) {
    return tagged("real", std::isnan(real) ? "nan" : real < 0 ? "-inf" : "inf");
  }
  if (number.kind() == NumberKind::Double) {
    return real;
  }
  char text[32];
  const char* end = std::to_chars(text, text + sizeof text, static_cast<float>(real)).ptr;
  double fewestDigits = real;
  std::from_chars(text, end, fewestDigits);
  return tagged("float", fewestDigits);
}

Json jsonOf(const PropertyValue& value);

Json jsonOf(const PropertyDict& dict) {
  // The library's own insertion searches all earlier names; ours are known to be different.
  Json::object_t object;
  object.reserve(dict.size());
  std::vector<Json::object_t::value_type>& entries = object;
  for (const auto& [key, entry] : dict) {
    entries.emplace_back(key, jsonOf(entry));
  }
  return object;
}

Json jsonOf(const PropertyValue& value) {
  if (const PropertyDict* dict = value.dict()) {
    return jsonOf(*dict);
  }
  if (const PropertyArray* array = value.array()) {
    Json::array_t elements;
    elements.reserve(array->size());
    for (const PropertyValue& element : *array) {
      elements.push_back(jsonOf(element));
    }
    return elements;
  }
  if (const std::string* string = value.string()) {
    return *string;
  }
  if (const Number* number = value.number()) {
    return jsonOf(*number);
  }
  if (const bool* boolean = value.boolean()) {
    return *boolean;
  }
  if (const Bytes* data = value.data()) {
    std::string text;
    appendBase64(*data, text);
    return tagged("data", std::move(text));
  }
  return tagged("date", dateText(value.date() != nullptr ? *value.date() : Date{}));
}

std::string textOf(const Json& json, int indentation) {
  return json.dump(indentation, ' ', false, Json::error_handler_t::replace);
}

PropertyValue integerValue(std::uint64_t integer) {
  return integer <= static_cast<std::uint64_t>(std::numeric_limits<std::int64_t>::max())
             ? PropertyValue(static_cast<std::int64_t>(integer))
             : PropertyValue(integer);
}

/// A dictionary that was read, or the value that it stands for.
std::optional<PropertyValue> untagged(PropertyDict dict, std::string& error) {
  if (dict.size() != 1) {
    return dict;
  }
  const auto& [name, content] = *dict.begin();
  if (const Number* number = content.number(); number != nullptr && name == "float") {
    const double real = number->asDouble();
    // The fewest digits of the largest float are a little more than it; from halfway to the next
    // power of two on a number would not round to it any more.
    constexpr double kBeyond = 0x1.ffffffp127;
    if (!(std::abs(real) < kBeyond)) {
      error = "a \"float\" that single precision cannot hold";
      return std::nullopt;
    }
    constexpr double kLargest = std::numeric_limits<float>::max();
    return PropertyValue(static_cast<float>(std::clamp(real, -kLargest, kLargest)));
  }
  const std::string* text = content.string();
  if (text == nullptr) {
    return dict;
  }
  if (name == "real") {
    if (*text == "nan") {
      return PropertyValue(std::numeric_limits<double>::quiet_NaN());
    }
    if (*text == "inf" || *text == "-inf") {
      const double infinity = std::numeric_limits<double>::infinity();
      return PropertyValue(text->front() == '-' ? -infinity : infinity);
    }
    error = "a \"real\" of " + quotedText(*text) + " instead of \"inf\", \"-inf\" or \"nan\"";
    return std::nullopt;
  }
  if (name == "data") {
    std::optional<Bytes> data = parseBase64(*text);
    if (!data) {
      error = quotedText(*text) + " is not base64";
      return std::nullopt;
    }
    return PropertyValue(*std::move(data));
  }
  if (name == "date") {
    const std::optional<Date> date = parseDateText(*text);
    if (!date) {
      error = quotedText(*text) + " is not a date";
      return std::nullopt;
    }
    return PropertyValue(*date);
  }
  return dict;
}

/// Builds the library's tree as its parser meets the parts: stricter than the library does, with
/// the digits of integers still at hand, and without its search for each name among the earlier.
class TreeBuilder final : public nlohmann::json_sax<Json> {
 public:
  explicit TreeBuilder(std::string& error) : _error(error) {}

  Json takeResult() { return std::move(_result); }

  bool null() override { return add(nullptr); }
  bool boolean(bool value) override { return add(value); }
  bool number_integer(number_integer_t value) override { return add(value); }
  bool number_unsigned(number_unsigned_t value) override { return add(value); }
  bool number_float(number_float_t value, const std::string& text) override {
    if (text.find_first_of(".eE") == std::string::npos) {
      return fail("the integer " + text.substr(0, 40) + " does not fit 64 bits");
    }
    return add(value);
  }
  bool string(std::string& value) override { return add(std::move(value)); }
  bool binary(Json::binary_t& /*value*/) override { return fail("binary data"); }
  bool start_object(std::size_t /*count*/) override { return open(true); }
  bool key(std::string& name) override {
    _open.back().name = std::move(name);
    return true;
  }
  bool end_object() override {
    Container& container = _open.back();
    std::vector<std::string_view> names;
    names.reserve(container.entries.size());
    for (const auto& entry : container.entries) {
      names.emplace_back(entry.first);
    }
    std::sort(names.begin(), names.end());
    if (const auto twice = std::adjacent_find(names.begin(), names.end()); twice != names.end()) {
      container.name = *twice;
      return fail("there twice");
    }
    Json::object_t object;
    static_cast<Entries&>(object) = std::move(container.entries);
    _open.pop_back();
    return add(std::move(object));
  }
  bool start_array(std::size_t /*count*/) override { return open(false); }
  bool end_array() override {
    Json::array_t elements = std::move(_open.back().elements);
    _open.pop_back();
    return add(std::move(elements));
  }
  bool parse_error(std::size_t /*position*/, const std::string& /*token*/,
                   const nlohmann::detail::exception& exception) override {
    std::string message = exception.what();
    message.erase(0, message.find(' ') + 1);  // "[json.exception....] parse error at line ..."
    if (dynamic_cast<const Json::parse_error*>(&exception) == nullptr) {
      return fail(message);  // a number that no double can hold
    }
    _error = std::move(message);
    return false;
  }

 private:
  using Entries = std::vector<Json::object_t::value_type>;
  struct Container {
    bool isObject;
    std::string name;
    Entries entries;
    Json::array_t elements;
  };

  bool open(bool isObject) {
    if (_open.size() == kMostNestedLevels) {
      return fail(kNestedTooDeeply);
    }
    _open.push_back({isObject, {}, {}, {}});
    return true;
  }

  bool add(Json value) {
    if (_open.empty()) {
      _result = std::move(value);
    } else if (Container& container = _open.back(); container.isObject) {
      container.entries.emplace_back(container.name, std::move(value));
    } else {
      container.elements.push_back(std::move(value));
    }
    return true;
  }

  bool fail(const std::string& message) {
    NestedPlace place;
    for (auto container = _open.rbegin(); container != _open.rend(); ++container) {
      if (container->isObject) {
        place.addOuterKey(container->name);
      } else {
        place.addOuterIndex(container->elements.size());
      }
    }
    _error = place.with(message);
    return false;
  }

  std::string& _error;
  std::vector<Container> _open;
  Json _result;
};

std::optional<PropertyValue> valueOf(const Json& json, NestedPlace& place, std::string& error) {
  if (json.is_object()) {
    PropertyDict dict;
    for (const auto& [name, content] : json.get_ref<const Json::object_t&>()) {
      std::optional<PropertyValue> value = valueOf(content, place, error);
      if (!value) {
        place.addOuterKey(name);
        return std::nullopt;
      }
      dict.set(name, *std::move(value));
    }
    return untagged(std::move(dict), error);
  }
  if (json.is_array()) {
    PropertyArray array;
    for (const Json& content : json) {
      std::optional<PropertyValue> value = valueOf(content, place, error);
      if (!value) {
        place.addOuterIndex(array.size());
        return std::nullopt;
      }
      array.push_back(*std::move(value));
    }
    return array;
  }
  if (json.is_string()) {
    return json.get_ref<const std::string&>();
  }
  if (json.is_boolean()) {
    return json.get<bool>();
  }
  if (json.is_number_unsigned()) {
    return integerValue(json.get<std::uint64_t>());
  }
  if (json.is_number_integer()) {
    return json.get<std::int64_t>();
  }
  if (json.is_number_float()) {
    return json.get<double>();
  }
  error = "null is no value";
  return std::nullopt;
}

}  // namespace

std::string jsonText(const PropertyValue& value) { return textOf(jsonOf(value), -1); }
std::string jsonText(const PropertyDict& dict) { return textOf(jsonOf(dict), -1); }
std::string indentedJsonText(const PropertyValue& value) { return textOf(jsonOf(value), 2); }

std::optional<Json> jsonFromText(std::string_view text, std::string& error) {
  TreeBuilder builder(error);
  return Json::sax_parse(text.begin(), text.end(), &builder) ? std::optional(builder.takeResult())
                                                             : std::nullopt;
}

std::optional<PropertyValue> valueFromJson(const Json& json, std::string& error) {
  NestedPlace place;
  std::string fault;
  std::optional<PropertyValue> value = valueOf(json, place, fault);
  if (!value) {
    error = place.with(fault);
  }
  return value;
}

std::optional<PropertyValue> valueFromJsonText(std::string_view text, std::string& error) {
  const std::optional<Json> json = jsonFromText(text, error);
  return json ? valueFromJson(*json, error) : std::nullopt;
}

}  // namespace vesprun
