#include "platform/host/documents/JsonForm.h"

#include <algorithm>
#include <charconv>
#include <cmath>
#include <cstdint>
#include <limits>
#include <string_view>
#include <utility>
#include <vector>

#include "common/Calendar.h"
#include "common/TextForm.h"
#include "platform/host/documents/Base64.h"
#include "platform/host/documents/NestedPlace.h"
#include "platform/host/documents/NumberText.h"
#include "platform/host/documents/QuotedText.h"
#include "platform/host/documents/XmlText.h"

namespace vesprun {

// The library handles what is neither plain text nor a short escape.
void appendJsonText(std::string_view string, std::string& text) {
  static constexpr std::string_view kEscaped = "\b\f\n\r\t\"\\";
  static constexpr std::string_view kEscapes = "bfnrt\"\\";
  const std::size_t begin = text.size();
  text += '"';
  const auto isPlain = [](char c) { return c >= ' ' && c < 0x7F && c != '"' && c != '\\'; };
  for (std::size_t at = 0; at < string.size();) {
    const auto* const from = string.begin() + static_cast<std::ptrdiff_t>(at);
    if (const auto plain = std::find_if_not(from, string.end(), isPlain) - from; plain > 0) {
      text.append(string, at, static_cast<std::size_t>(plain));
      at += static_cast<std::size_t>(plain);
      continue;
    }
    if (const auto escape = kEscaped.find(string[at]); escape != std::string_view::npos) {
      text.append(1, '\\').append(1, kEscapes[escape]);
      ++at;
      continue;
    }
    const std::size_t length = xmlCharacterLength(string.substr(at));
    if (length == 0) {
      text.resize(begin);
      text += Json(string).dump(-1, ' ', false, Json::error_handler_t::replace);
      return;
    }
    text.append(string, at, length);
    at += length;
  }
  text += '"';
}

namespace {

void append(const PropertyValue& value, std::string& text);

void appendTagged(const char* name, std::string_view string, std::string& text) {
  text.append("{\"").append(name).append("\":");
  appendJsonText(string, text);
  text += '}';
}

void append(const Number& number, std::string& text) {
  if (!number.isFloatingPoint()) {
    text += textForm(number);
    return;
  }
  const double real = number.asDouble();
  if (!std::isfinite(real)) {
    appendTagged("real", textForm(number), text);
    return;
  }
  if (number.kind() == NumberKind::Double) {
    text += Json(real).dump();
    return;
  }
  char digits[32];
  const char* end = std::to_chars(digits, digits + sizeof digits, static_cast<float>(real)).ptr;
  double fewestDigits = real;
  std::from_chars(digits, end, fewestDigits);
  text.append("{\"float\":").append(Json(fewestDigits).dump()).append("}");
}

void append(const PropertyDict& dict, std::string& text) {
  text += '{';
  for (const auto& [key, entry] : dict) {
    text.append(text.back() == '{' ? "" : ",");
    appendJsonText(key, text);
    text += ':';
    append(entry, text);
  }
  text += '}';
}

void append(const PropertyValue& value, std::string& text) {
  if (const PropertyDict* dict = value.dict()) {
    append(*dict, text);
  } else if (const PropertyArray* array = value.array()) {
    text += '[';
    for (const PropertyValue& element : *array) {
      text.append(&element == array->data() ? "" : ",");
      append(element, text);
    }
    text += ']';
  } else if (const std::string* string = value.string()) {
    appendJsonText(*string, text);
  } else if (const Number* number = value.number()) {
    append(*number, text);
  } else if (const bool* boolean = value.boolean()) {
    text += *boolean ? "true" : "false";
  } else if (const Bytes* data = value.data()) {
    text += "{\"data\":\"";
    appendBase64(*data, text);
    text += "\"}";
  } else {
    appendTagged("date", dateText(value.date() != nullptr ? *value.date() : Date{}), text);
  }
}

}  // namespace

std::string jsonText(const PropertyValue& value) {
  std::string text;
  append(value, text);
  return text;
}

std::string jsonText(const PropertyDict& dict) {
  std::string text;
  append(dict, text);
  return text;
}

void to_json(Json& json, const PropertyValue& value) {
  if (const PropertyDict* dict = value.dict()) {
    to_json(json, *dict);
  } else if (const PropertyArray* array = value.array()) {
    json = Json::array();
    for (const PropertyValue& element : *array) {
      json.push_back(element);
    }
  } else {
    json = Json::parse(jsonText(value));
  }
}
void to_json(Json& json, const PropertyDict& dict) {
  json = Json::object();
  // The library would look for each key among all before it.
  Json::object_t::Container& entries = json.get_ref<Json::object_t&>();
  for (const auto& [key, value] : dict) {
    entries.emplace_back(Json(PropertyValue(key)).get_ref<std::string&>(), value);
  }
}
void to_json(Json& json, const Number& number) { to_json(json, PropertyValue(number)); }

std::string jsonText(const Json& json) {
  return json.dump(-1, ' ', false, Json::error_handler_t::replace);
}

namespace {

/// Decodes a tagged object (`{"date": ...}`). Nothing for any other dictionary and, with a text in
/// `fault`, for an entry that means nothing.
std::optional<PropertyValue> meaningOf(const PropertyDict& dict, std::string& fault) {
  if (dict.size() != 1) {
    return std::nullopt;
  }
  const auto& [name, content] = *dict.begin();
  if (const Number* number = content.number(); number != nullptr && name == "float") {
    const double real = number->asDouble();
    // The shortest text of the largest float is slightly above it, but rounds to it up to here.
    constexpr double kBeyond = 0x1.ffffffp127;
    if (!(std::abs(real) < kBeyond)) {
      fault = "a \"float\" that single precision cannot hold";
      return std::nullopt;
    }
    constexpr double kMax = std::numeric_limits<float>::max();
    return PropertyValue(static_cast<float>(std::clamp(real, -kMax, kMax)));
  }
  const std::string* text = content.string();
  if (text == nullptr) {
    return std::nullopt;
  }
  if (name == "real") {
    if (double real = 0; parseWholeText(*text, real) && !std::isfinite(real)) {
      return PropertyValue(real);
    }
    fault = "a \"real\" of " + quotedText(*text) + " instead of \"inf\", \"-inf\" or \"nan\"";
  } else if (name == "data") {
    if (std::optional<Bytes> data = parseBase64(*text)) {
      return PropertyValue(*std::move(data));
    }
    fault = quotedText(*text) + " is not base64";
  } else if (name == "date") {
    if (const std::optional<Date> date = parseDateText(*text)) {
      return PropertyValue(*date);
    }
    fault = quotedText(*text) + " is not a date";
  }
  return std::nullopt;
}

/// Replaces tagged objects by the values they encode; stops at the first fault.
void resolve(PropertyValue& value, std::string& fault, NestedPlace& place) {
  const auto resolvePart = [&](const auto& step, const PropertyValue& part) {
    // Containers show their parts as constants.
    resolve(const_cast<PropertyValue&>(part), fault, place);
    if (!fault.empty()) {
      place.addOuter(step);
    }
    return fault.empty();
  };
  const PropertyValue& plain = value;
  if (plain.data() != nullptr) {
    fault = "null is no value";
  } else if (const PropertyArray* array = plain.array()) {
    for (std::size_t index = 0; index < array->size(); ++index) {
      if (!resolvePart(index, (*array)[index])) {
        return;
      }
    }
  } else if (const PropertyDict* dict = plain.dict()) {
    for (const auto& [name, entry] : *dict) {
      if (!resolvePart(name, entry)) {
        return;
      }
    }
    if (std::optional<PropertyValue> meaning = meaningOf(*dict, fault)) {
      value = *std::move(meaning);
    }
  }
}

/// Builds plain values as the library meets the parts: stricter than the library's own tree, and it
/// sees the digits of integers.
class ValueBuilder final : public nlohmann::json_sax<Json> {
 public:
  explicit ValueBuilder(std::string& error) : _error(error) {}

  std::optional<PropertyValue> takeResult() { return std::move(_result); }

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

  bool null() override { return add(Bytes{}); }
  bool boolean(bool value) override { return add(value); }
  bool number_integer(number_integer_t value) override { return add(value); }
  bool number_unsigned(number_unsigned_t value) override {
    return std::in_range<std::int64_t>(value) ? add(static_cast<std::int64_t>(value)) : add(value);
  }
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
    return add(std::move(dict));
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
    std::optional<std::string> twice{};  ///< the first duplicate name in byte order
  };

  bool open(bool isObject) {
    if (_open.size() == kMaxNestedLevels) {
      return fail(kNestedTooDeeply);
    }
    _open.push_back({isObject});
    return true;
  }

  bool fail(const std::string& message) {
    NestedPlace place;
    for (auto container = _open.rbegin(); container != _open.rend(); ++container) {
      if (container->isObject) {
        place.addOuter(container->name);
      } else {
        place.addOuter(container->array.size());
      }
    }
    _error = place.with(message);
    return false;
  }

  std::string& _error;
  std::vector<Container> _open;
  std::optional<PropertyValue> _result;
};

}  // namespace

std::optional<PropertyValue> plainValueFromJsonText(std::string_view text, std::string& error) {
  ValueBuilder builder(error);
  return Json::sax_parse(text.begin(), text.end(), &builder) ? builder.takeResult() : std::nullopt;
}

std::optional<PropertyValue> valueFromPlain(PropertyValue plain, std::string& error) {
  std::string fault;
  NestedPlace place;
  resolve(plain, fault, place);
  if (fault.empty()) {
    return plain;
  }
  error = place.with(fault);
  return std::nullopt;
}

std::optional<PropertyValue> valueFromJsonText(std::string_view text, std::string& error) {
  std::optional<PropertyValue> plain = plainValueFromJsonText(text, error);
  return plain ? valueFromPlain(*std::move(plain), error) : std::nullopt;
}

}  // namespace vesprun
