#include "platform/host/documents/PtreeWriter.h"

#include <algorithm>
#include <charconv>
#include <cmath>
#include <cstddef>
#include <string_view>

#include "common/Calendar.h"
#include "platform/host/documents/Base64.h"
#include "platform/host/documents/NestedPlace.h"
#include "platform/host/documents/QuotedText.h"
#include "platform/host/documents/XmlText.h"

namespace vesprun {
namespace {

class TreeWriter {
 public:
  explicit TreeWriter(std::string& document) : _document(document) {}

  std::string error() const { return _place.with(_fault); }

  bool write(const PropertyValue& value) {
    if (const PropertyDict* dict = value.dict()) {
      return write(*dict);
    }
    if (const PropertyArray* array = value.array()) {
      return write(*array);
    }
    indent();
    if (const std::string* string = value.string()) {
      return writeText("string", *string);
    }
    if (const Number* number = value.number()) {
      writeNumber(*number);
    } else if (const bool* boolean = value.boolean()) {
      _document += *boolean ? "<true/>\n" : "<false/>\n";
    } else if (const Bytes* data = value.data()) {
      _document += "<data>";
      appendBase64(*data, _document);
      _document += "</data>\n";
    } else if (const Date* date = value.date()) {
      return writeDate(*date);
    }
    return true;
  }

  bool write(const PropertyDict& dict) {
    if (!open("dict", dict.empty())) {
      return false;
    }
    for (const auto& [key, value] : dict) {
      indent();
      if (!writeText("key", key) || !write(value)) {
        _place.addOuterKey(key);
        return false;
      }
    }
    close("dict", dict.empty());
    return true;
  }

 private:
  bool write(const PropertyArray& array) {
    if (!open("array", array.empty())) {
      return false;
    }
    for (std::size_t index = 0; index < array.size(); ++index) {
      if (!write(array[index])) {
        _place.addOuterIndex(index);
        return false;
      }
    }
    close("array", array.empty());
    return true;
  }

  bool open(std::string_view name, bool empty) {
    if (_level == kMostNestedLevels) {
      return fail(kNestedTooDeeply);
    }
    indent();
    tag("<", name, empty ? "/>\n" : ">\n");
    ++_level;
    return true;
  }

  void close(std::string_view name, bool empty) {
    --_level;
    if (!empty) {
      indent();
      tag("</", name, ">\n");
    }
  }

  void tag(std::string_view start, std::string_view name, std::string_view end) {
    _document.append(start).append(name).append(end);
  }

  void indent() { _document.append(_level, '\t'); }

  bool writeText(std::string_view name, std::string_view text) {
    if (!isXmlText(text)) {
      return fail("the " + std::string(name) + ' ' + quotedText(text) +
                  " holds what XML cannot carry");
    }
    tag("<", name, ">");
    while (true) {
      const auto* const special = std::find_if(text.begin(), text.end(), isSpecial);
      _document.append(text.begin(), special);
      if (special == text.end()) {
        break;
      }
      // XML readers turn a bare carriage return into a line feed.
      _document += *special == '&'   ? "&amp;"
                   : *special == '<' ? "&lt;"
                   : *special == '>' ? "&gt;"
                                     : "&#13;";
      text = {special + 1, text.end()};
    }
    tag("</", name, ">\n");
    return true;
  }

  static bool isSpecial(char c) { return c == '&' || c == '<' || c == '>' || c == '\r'; }

  void writeNumber(const Number& number) {
    char text[32];
    char* const end = text + sizeof text;
    const char* name = "integer";
    char* last = nullptr;
    if (number.isFloatingPoint()) {
      name = "real";
      const double real = number.asDouble();
      // A NaN's sign means nothing.
      last = std::to_chars(text, end, std::isnan(real) ? std::abs(real) : real).ptr;
    } else if (number.isSigned()) {
      last = std::to_chars(text, end, number.asInt64()).ptr;
    } else {
      last = std::to_chars(text, end, number.asUInt64()).ptr;
    }
    tag("<", name, ">");
    _document.append(text, last);
    tag("</", name, ">\n");
  }

  bool writeDate(const Date& date) {
    const std::string text = dateText(date);
    if (parseDateText(text) != date) {
      return fail("a date that has no text");
    }
    _document += "<date>";
    _document += text;
    _document += "</date>\n";
    return true;
  }

  bool fail(std::string message) {
    _fault = std::move(message);
    return false;
  }

  std::string& _document;
  std::string _fault;
  NestedPlace _place;  ///< of the fault
  std::size_t _level = 0;
};

template <typename T>
bool writeDocument(const T& value, std::string& document, std::string& error) {
  const std::size_t before = document.size();
  document +=
      "<?xml version=\"1.0\" encoding=\"UTF-8\"?>\n"
      "<ptree version=\"1.0\">\n";
  TreeWriter writer(document);
  if (!writer.write(value)) {
    error = writer.error();
    document.resize(before);
    return false;
  }
  document += "</ptree>\n";
  return true;
}

}  // namespace

bool writePtree(const PropertyValue& value, std::string& document, std::string& error) {
  return writeDocument(value, document, error);
}

bool writePtree(const PropertyDict& dict, std::string& document, std::string& error) {
  return writeDocument(dict, document, error);
}

}  // namespace vesprun
