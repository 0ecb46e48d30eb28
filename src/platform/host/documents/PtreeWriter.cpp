#include "platform/host/documents/PtreeWriter.h"

#include <algorithm>
#include <charconv>
#include <cmath>
#include <cstddef>
#include <initializer_list>
#include <iterator>
#include <string_view>
#include <utility>

#include "common/Calendar.h"
#include "common/TextForm.h"
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
constexpr std::size_t kPieceSize = 1 << 20;

/// Walks through a value, as far as a document can carry it, and writes it line by line.
class TreeWalk {
 public:
  /// Appends to `text`, which `sink` takes and leaves empty whenever it has grown large. Without a
  /// sink (null) it keeps all; without a text (null) the walk only checks the value.
  TreeWalk(std::string* text, const PtreeSerialization::Sink* sink) : _text(text), _sink(sink) {}

  /// Of the part that ended the walk: `take` returned false.
  std::string error() const { return _place.with(_fault); }

  bool take(const PropertyValue& value) {
    if (const PropertyDict* dict = value.dict()) {
      return take(*dict);
    }
    if (const PropertyArray* array = value.array()) {
      return takeContainer("array", array->empty(), [&] { return takeElements(*array); });
    }
    if (const std::string* string = value.string()) {
      return takeText("string", *string);
    }
    if (const Date* date = value.date()) {
      const std::string text = dateText(*date);
      writeLine({"<date>", text, "</date>"});
      return parseDateText(text) == *date || fail("a date that has no text");
    }
    if (_text != nullptr) {
      writeSimple(value);
    }
    return true;
  }

  bool take(const PropertyDict& dict) {
    return takeContainer("dict", dict.empty(), [&] { return takeEntries(dict); });
  }

  bool take(const PtreeDocument& document) {
    return takeContainer("dict", document.entries.empty() && !document.lastArray, [&] {
      return takeEntries(document.entries) && (!document.lastArray || takeLastArray(document));
    });
  }

 private:
  template <typename Content>
  bool takeContainer(std::string_view name, bool isEmpty, const Content& takeContent) {
    writeLine({"<", name, isEmpty ? "/>" : ">"});
    if (++_level > kMaxNestedLevels) {
      return fail(kNestedTooDeeply);
    }
    if (!takeContent()) {
      return false;
    }
    --_level;
    if (!isEmpty) {
      writeLine({"</", name, ">"});
    }
    return true;
  }

  bool takeEntries(const PropertyDict& dict) {
    for (const auto& [key, value] : dict) {
      if (!takeText("key", key) || !take(value)) {
        return failAt(key);
      }
    }
    return true;
  }

  bool takeElements(const PropertyArray& array) {
    for (std::size_t index = 0; index < array.size(); ++index) {
      if (!take(array[index])) {
        return failAt(index);
      }
    }
    return true;
  }

  bool takeLastArray(const PtreeDocument& document) {
    bool isEmpty = true;
    document.lastArray([&isEmpty](const PropertyDict&) { return isEmpty = false; });
    const auto takeAll = [&] {
      bool isGood = true;
      std::size_t index = 0;
      document.lastArray([&](const PropertyDict& element) {
        isGood = take(element) || failAt(index);
        ++index;
        return isGood;
      });
      return isGood;
    };
    return (takeText("key", document.lastKey) && takeContainer("array", isEmpty, takeAll)) ||
           failAt(document.lastKey);
  }

  bool takeText(std::string_view name, std::string_view text) {
    if (!isXmlText(text)) {
      return fail("the " + std::string(name) + ' ' + quotedText(text) +
                  " holds what XML cannot carry");
    }
    if (_text != nullptr) {
      const bool isPlain = std::none_of(text.begin(), text.end(), isEscaped);
      const std::string escapes = isPlain ? std::string() : escaped(text);
      writeLine({"<", name, ">", isPlain ? text : escapes, "</", name, ">"});
    }
    return true;
  }

  static bool isEscaped(char c) { return c == '&' || c == '<' || c == '>' || c == '\r'; }

  static std::string escaped(std::string_view text) {
    std::string result;
    for (const char& c : text) {
      // XML readers turn a bare carriage return into a line feed.
      result += c == '&'    ? "&amp;"
                : c == '<'  ? "&lt;"
                : c == '>'  ? "&gt;"
                : c == '\r' ? "&#13;"
                            : std::string_view(&c, 1);
    }
    return result;
  }

  /// A number, boolean or data: a document can carry all of them.
  void writeSimple(const PropertyValue& value) {
    if (const Bytes* data = value.data()) {
      std::string text;
      appendBase64(*data, text);
      writeLine({"<data>", text, "</data>"});
    } else if (const bool* boolean = value.boolean()) {
      writeLine({*boolean ? "<true/>" : "<false/>"});
    } else if (const Number* number = value.number()) {
      writeNumber(*number);
    }
  }

  void writeNumber(const Number& number) {
    if (!number.isFloatingPoint()) {
      return writeLine({"<integer>", textForm(number), "</integer>"});
    }
    const double real = number.asDouble();
    char text[32];
    // A NaN's sign means nothing.
    const char* end = std::to_chars(text, std::end(text), std::isnan(real) ? NAN : real).ptr;
    writeLine({"<real>", {text, end}, "</real>"});
  }

  void writeLine(std::initializer_list<std::string_view> parts) {
    if (_text == nullptr) {
      return;
    }
    _text->append(_level, '\t');
    for (const std::string_view part : parts) {
      *_text += part;
    }
    *_text += '\n';
    if (_sink != nullptr && _text->size() >= kPieceSize) {
      (*_sink)(*_text);
      _text->clear();
    }
  }

  bool fail(std::string message) {
    _fault = std::move(message);
    return false;
  }
  template <typename Step>
  bool failAt(const Step& step) {
    _place.addOuter(step);
    return false;
  }

  std::string* _text;
  const PtreeSerialization::Sink* _sink;
  std::size_t _level = 0;
  std::string _fault;
  NestedPlace _place;  ///< of the fault
};

template <typename T>
bool writeWhole(const T& value, std::string& document, std::string& error) {
  const std::size_t start = document.size();
  document += kStart;
  TreeWalk walk(&document, nullptr);
  if (!walk.take(value)) {
    document.resize(start);
    error = walk.error();
    return false;
  }
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

bool isPtree(const PtreeDocument& document, std::string& error) {
  TreeWalk check(nullptr, nullptr);
  const bool result = check.take(document);
  error = result ? error : check.error();
  return result;
}

void writePtree(const PtreeDocument& document, const PtreeSerialization::Sink& sink) {
  std::string text = kStart;
  TreeWalk(&text, &sink).take(document);
  text += kEnd;
  sink(text);
}

}  // namespace vesprun
