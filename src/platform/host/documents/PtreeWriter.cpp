#include "platform/host/documents/PtreeWriter.h"

#include <algorithm>
#include <charconv>
#include <cmath>
#include <cstddef>
#include <string_view>
#include <utility>

#include "common/Calendar.h"
#include "platform/host/documents/Base64.h"
#include "platform/host/documents/NestedPlace.h"
#include "platform/host/documents/QuotedText.h"
#include "platform/host/documents/XmlText.h"

namespace vesprun {
namespace {

constexpr const char* kStart =
    "<?xml version=\"1.0\" encoding=\"UTF-8\"?>\n"
    "<ptree version=\"1.0\">\n";
constexpr const char* kEnd = "</ptree>\n";
constexpr std::size_t kPieceSize = 64 * 1024;

/// Finds what a document cannot carry.
class TreeCheck {
 public:
  std::string error() const { return _place.with(_fault); }

  bool passes(const PropertyValue& value) {
    if (const PropertyDict* dict = value.dict()) {
      return passes(*dict);
    }
    if (const PropertyArray* array = value.array()) {
      return passes(*array);
    }
    if (const std::string* string = value.string()) {
      return isText("string", *string);
    }
    const Date* date = value.date();
    return date == nullptr || parseDateText(dateText(*date)) == *date ||
           fail("a date that has no text");
  }

  bool passes(const PropertyDict& dict) {
    if (!enter() || !entriesPass(dict)) {
      return false;
    }
    --_level;
    return true;
  }

  bool passes(const PtreeDocument& document) {
    ++_level;
    if (!entriesPass(document.entries)) {
      return false;
    }
    if (!document.lastArray) {
      return true;
    }
    ++_level;
    bool result = true;
    std::size_t index = 0;
    document.lastArray([&](const PropertyDict& element) {
      result = passes(element) || failAt(index);
      ++index;
      return result;
    });
    return result || failAt(document.lastKey);
  }

 private:
  bool passes(const PropertyArray& array) {
    if (!enter()) {
      return false;
    }
    for (std::size_t index = 0; index < array.size(); ++index) {
      if (!passes(array[index])) {
        return failAt(index);
      }
    }
    --_level;
    return true;
  }

  bool entriesPass(const PropertyDict& dict) {
    for (const auto& [key, value] : dict) {
      if (!isText("key", key) || !passes(value)) {
        return failAt(key);
      }
    }
    return true;
  }

  bool enter() { return ++_level <= kMostNestedLevels || fail(kNestedTooDeeply); }

  bool isText(std::string_view name, std::string_view text) {
    return isXmlText(text) || fail("the " + std::string(name) + ' ' + quotedText(text) +
                                   " holds what XML cannot carry");
  }

  bool fail(std::string message) {
    _fault = std::move(message);
    return false;
  }
  bool failAt(std::string_view key) {
    _place.addOuterKey(key);
    return false;
  }
  bool failAt(std::size_t index) {
    _place.addOuterIndex(index);
    return false;
  }

  std::string _fault;
  NestedPlace _place;  ///< of the fault
  std::size_t _level = 0;
};

/// Writes what the check lets pass.
class TreeWriter {
 public:
  /// Appends to `text`, which `sink` takes and leaves empty whenever it has grown large. Without a
  /// sink (null) it keeps all.
  TreeWriter(std::string& text, const PtreeSerialization::Sink* sink) : _text(text), _sink(sink) {}

  void write(const PropertyValue& value) {
    if (const PropertyDict* dict = value.dict()) {
      return write(*dict);
    }
    if (const PropertyArray* array = value.array()) {
      return write(*array);
    }
    indent();
    if (const std::string* string = value.string()) {
      writeText("string", *string);
    } else if (const Number* number = value.number()) {
      writeNumber(*number);
    } else if (const bool* boolean = value.boolean()) {
      _text += *boolean ? "<true/>\n" : "<false/>\n";
    } else if (const Bytes* data = value.data()) {
      _text += "<data>";
      appendBase64(*data, _text);
      _text += "</data>\n";
    } else if (const Date* date = value.date()) {
      _text += "<date>";
      _text += dateText(*date);
      _text += "</date>\n";
    }
    passOn();
  }

  void write(const PropertyDict& dict) {
    open("dict", dict.empty());
    writeEntries(dict);
    close("dict", dict.empty());
  }

  void write(const PtreeDocument& document) {
    const bool isEmpty = document.entries.empty() && !document.lastArray;
    open("dict", isEmpty);
    writeEntries(document.entries);
    if (document.lastArray) {
      writeLastArray(document);
    }
    close("dict", isEmpty);
  }

 private:
  void write(const PropertyArray& array) {
    open("array", array.empty());
    for (const PropertyValue& element : array) {
      write(element);
    }
    close("array", array.empty());
  }

  void writeLastArray(const PtreeDocument& document) {
    writeKey(document.lastKey);
    bool isEmpty = true;
    document.lastArray([&](const PropertyDict& element) {
      if (std::exchange(isEmpty, false)) {
        open("array", false);
      }
      write(element);
      return true;
    });
    if (isEmpty) {
      open("array", true);
    }
    close("array", isEmpty);
  }

  void writeEntries(const PropertyDict& dict) {
    for (const auto& [key, value] : dict) {
      writeKey(key);
      write(value);
    }
  }

  void writeKey(std::string_view key) {
    indent();
    writeText("key", key);
  }

  void passOn() {
    if (_sink != nullptr && _text.size() >= kPieceSize) {
      (*_sink)(_text);
      _text.clear();
    }
  }

  void open(std::string_view name, bool empty) {
    indent();
    tag("<", name, empty ? "/>\n" : ">\n");
    ++_level;
  }

  void close(std::string_view name, bool empty) {
    --_level;
    if (!empty) {
      indent();
      tag("</", name, ">\n");
    }
  }

  void tag(std::string_view start, std::string_view name, std::string_view end) {
    _text.append(start).append(name).append(end);
  }

  void indent() { _text.append(_level, '\t'); }

  void writeText(std::string_view name, std::string_view text) {
    tag("<", name, ">");
    while (true) {
      const auto* const special = std::find_if(text.begin(), text.end(), isSpecial);
      _text.append(text.begin(), special);
      if (special == text.end()) {
        break;
      }
      // XML readers turn a bare carriage return into a line feed.
      _text += *special == '&'   ? "&amp;"
               : *special == '<' ? "&lt;"
               : *special == '>' ? "&gt;"
                                 : "&#13;";
      text = {special + 1, text.end()};
    }
    tag("</", name, ">\n");
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
    _text.append(text, last);
    tag("</", name, ">\n");
  }

  std::string& _text;
  const PtreeSerialization::Sink* _sink;
  std::size_t _level = 0;
};

template <typename T>
bool check(const T& value, std::string& error) {
  TreeCheck check;
  if (!check.passes(value)) {
    error = check.error();
    return false;
  }
  return true;
}

template <typename T>
bool writeWhole(const T& value, std::string& document, std::string& error) {
  if (!check(value, error)) {
    return false;
  }
  document += kStart;
  TreeWriter(document, nullptr).write(value);
  document += kEnd;
  return true;
}

}  // namespace

bool writePtree(const PropertyValue& value, std::string& document, std::string& error) {
  return writeWhole(value, document, error);
}

bool writePtree(const PropertyDict& dict, std::string& document, std::string& error) {
  return writeWhole(dict, document, error);
}

bool isPtree(const PtreeDocument& document, std::string& error) { return check(document, error); }

void writePtree(const PtreeDocument& document, const PtreeSerialization::Sink& sink) {
  std::string text = kStart;
  TreeWriter(text, &sink).write(document);
  text += kEnd;
  sink(text);
}

}  // namespace vesprun
