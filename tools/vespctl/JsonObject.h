#pragma once

#include <optional>
#include <string>
#include <string_view>

#include "platform/host/documents/JsonForm.h"

namespace vesprun {

/// The text of a JSON object, member by member: one that is null has no `PropertyValue`.
class JsonObject {
 public:
  JsonObject& add(std::string_view name, const std::optional<PropertyValue>& value) {
    return addText(name, value ? jsonText(*value) : "null");
  }
  /// The value as JSON text.
  JsonObject& addText(std::string_view name, std::string_view json) {
    _text += _text.empty() ? '{' : ',';
    appendJsonText(name, _text);
    _text.append(":").append(json);
    return *this;
  }
  std::string text() const { return _text + '}'; }

 private:
  std::string _text;
};

/// The text of a JSON array, element by element.
class JsonArray {
 public:
  void add(std::string_view json) { _text.append(_text.empty() ? "[" : ",").append(json); }
  bool empty() const { return _text.empty(); }
  std::string text() const { return empty() ? "[]" : _text + ']'; }

 private:
  std::string _text;
};

}  // namespace vesprun
