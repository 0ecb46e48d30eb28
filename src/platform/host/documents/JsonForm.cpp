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

/// Builds values as the library's parser meets the parts: stricter than the library's own tree, and
/// with the digits of integers still at hand.
class ValueBuilder final : public nlohmann::json_sax<Json> {
 public:
  ValueBuilder(bool plain, std::string& error) : _plain(plain), _error(error) {}

  /// Nothing when a part that is JSON has no value; the first such part is the error.
  std::optional<PropertyValue> takeResult() {
    if (!_valueError.empty()) {
      _error = std::move(_valueError);
      return std::nullopt;
    }
    return std::move(_result);
  }

  bool add(PropertyValue value) {
    if (_open.empty()) {
      _result = std::move(value);
    } else if (Container& container = _open.back(); container.isObject) {
      container.dict.set(container.name, std::move(value));
    } else {
      container.array.push_back(std::move(value));
    }
    return true;
  }

  bool null() override {
    if (_plain) {
      return add(Bytes{});
    }
    return addInvalid("null is no value");
  }
  bool boolean(bool value) override { return add(value); }
  bool number_integer(number_integer_t value) override { return add(value); }
  bool number_unsigned(number_unsigned_t value) override { return add(integerValue(value)); }
  bool number_float(number_float_t value, const std::string& text) override {
    if (text.find_first_of(".eE") == std::string::npos) {
      return fail("the integer " + text.substr(0, 40) + " does not fit 64 bits");
    }
    return add(value);
  }
  bool string(std::string& value) override { return add(std::string_view(value)); }
  bool binary(Json::binary_t& /*value*/) override { return fail("binary data"); }
  bool start_object(std::size_t /*count*/) override { return open(true); }
  bool key(std::string& name) override {
    Container& object = _open.back();
    if (object.dict.contains(name) && (!object.twice || name < *object.twice)) {
      object.twice = name;
    }
    object.name = std::move(name);
    return true;
  }
  bool end_object() override {
    Container& object = _open.back();
    if (object.twice) {
      object.name = *std::move(object.twice);
      return fail("there twice");
    }
    PropertyDict dict = std::move(object.dict);
    _open.pop_back();
    if (_plain) {
      return add(std::move(dict));
    }
    std::string fault;
    std::optional<PropertyValue> value = untagged(std::move(dict), fault);
    return value ? add(*std::move(value)) : addInvalid(fault);
  }
  bool start_array(std::size_t /*count*/) override { return open(false); }
  bool end_array() override {
    PropertyArray array = std::move(_open.back().array);
    _open.pop_back();
    return add(std::move(array));
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
  struct Container {
    bool isObject;
    std::string name{};
    PropertyDict dict{};
    PropertyArray array{};
    std::optional<std::string> twice{};  ///< the first of the names that came again
  };

  bool open(bool isObject) {
    if (_open.size() == kMostNestedLevels) {
      return fail(kNestedTooDeeply);
    }
    _open.push_back({isObject});
    return true;
  }

  /// Goes on, since what is no JSON further down is the error then.
  bool addInvalid(const std::string& why) {
    if (_valueError.empty()) {
      _valueError = placed(why);
    }
    return add(false);
  }

  bool fail(const std::string& message) {
    _error = placed(message);
    return false;
  }

  std::string placed(const std::string& message) const {
    NestedPlace place;
    for (auto container = _open.rbegin(); container != _open.rend(); ++container) {
      if (container->isObject) {
        place.addOuterKey(container->name);
      } else {
        place.addOuterIndex(container->array.size());
      }
    }
    return place.with(message);
  }

  bool _plain;
  std::string& _error;
  std::string _valueError;
  std::vector<Container> _open;
  std::optional<PropertyValue> _result;
};

std::optional<PropertyValue> read(std::string_view text, bool plain, std::string& error) {
  ValueBuilder builder(plain, error);
  return Json::sax_parse(text.begin(), text.end(), &builder) ? builder.takeResult() : std::nullopt;
}

/// Hands a plain value to a builder once more.
void replay(const PropertyValue& plain, ValueBuilder& builder) {
  if (const PropertyDict* dict = plain.dict()) {
    builder.start_object(dict->size());
    for (const auto& [name, content] : *dict) {
      std::string copy = name;
      builder.key(copy);
      replay(content, builder);
    }
    builder.end_object();
  } else if (const PropertyArray* array = plain.array()) {
    builder.start_array(array->size());
    for (const PropertyValue& content : *array) {
      replay(content, builder);
    }
    builder.end_array();
  } else if (plain.data() != nullptr) {
    builder.null();
  } else {
    builder.add(plain);
  }
}

}  // namespace

std::string jsonText(const PropertyValue& value) { return textOf(jsonOf(value), -1); }
std::string jsonText(const PropertyDict& dict) { return textOf(jsonOf(dict), -1); }
std::string indentedJsonText(const PropertyValue& value) { return textOf(jsonOf(value), 2); }

std::optional<PropertyValue> plainValueFromJsonText(std::string_view text, std::string& error) {
  return read(text, true, error);
}

std::optional<PropertyValue> valueFromPlain(const PropertyValue& plain, std::string& error) {
  ValueBuilder builder(false, error);
  replay(plain, builder);
  return builder.takeResult();
}

std::optional<PropertyValue> valueFromJsonText(std::string_view text, std::string& error) {
  return read(text, false, error);
}

}  // namespace vesprun
