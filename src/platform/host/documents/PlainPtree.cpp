#include "platform/host/documents/PlainPtree.h"

#include <array>
#include <cstddef>
#include <cstdint>
#include <utility>

#include "common/Calendar.h"
#include "platform/host/documents/Base64.h"
#include "platform/host/documents/NestedPlace.h"
#include "platform/host/documents/NumberText.h"
#include "platform/host/documents/XmlText.h"

namespace vesprun {
namespace {

/// Bytes that stand for themselves in a text, wherever they are.
constexpr std::array<bool, 256> kIsPlain = [] {
  std::array<bool, 256> plain{};
  for (std::size_t byte = ' '; byte < 0x80; ++byte) {
    plain[byte] = byte != '<' && byte != '&' && byte != ']';
  }
  plain['\t'] = plain['\n'] = true;
  return plain;
}();

/// Every operation gives false at what it does not know.
class PlainPtreeReader {
 public:
  explicit PlainPtreeReader(std::string_view document) : _rest(document) {}

  bool readDocument(PropertyValue& value) {
    take("<?xml version=\"1.0\" encoding=\"UTF-8\"?>");
    const bool isRead =
        takeTag("<ptree version=\"1.0\">") && readValue(value, 0) && takeTag("</ptree>");
    skipSpace();
    return isRead && _rest.empty();
  }

 private:
  bool readValue(PropertyValue& value, std::size_t level) {
    skipSpace();
    if (take("<integer>")) {
      return takeText("</integer>") && store(parseInteger(_text), value);
    }
    if (take("<string>")) {
      return takeText("</string>") && store(std::optional(_text), value);
    }
    if (take("<real>")) {
      return takeText("</real>") && store(parseReal(_text), value);
    }
    if (take("<data>")) {
      return takeText("</data>") && store(parseBase64(_text), value);
    }
    if (take("<date>")) {
      return takeText("</date>") && store(parseDateText(_text), value);
    }
    if (take("<true/>")) {
      value = true;
      return true;
    }
    if (take("<false/>")) {
      value = false;
      return true;
    }
    return level < kMostNestedLevels && readContainer(value, level);
  }

  bool readContainer(PropertyValue& value, std::size_t level) {
    if (take("<dict>")) {
      PropertyDict dict;
      PropertyValue entry = false;
      while (takeTag("<key>")) {
        if (!takeText("</key>")) {
          return false;
        }
        const std::string_view key = _text;
        if (!readValue(entry, level + 1)) {
          return false;
        }
        dict.set(key, std::move(entry));
      }
      value = std::move(dict);
      return take("</dict>");
    }
    if (take("<array>")) {
      PropertyArray array;
      while (!takeTag("</array>")) {
        if (!readValue(array.emplace_back(false), level + 1)) {
          return false;
        }
      }
      value = std::move(array);
      return true;
    }
    if (take("<dict/>")) {
      value = PropertyDict();
      return true;
    }
    value = PropertyArray();
    return take("<array/>");
  }

  bool take(std::string_view markup) {
    const bool isNext = _rest.starts_with(markup);
    _rest.remove_prefix(isNext ? markup.size() : 0);
    return isNext;
  }

  void skipSpace() {
    const auto isSpace = [](char c) { return c == ' ' || c == '\t' || c == '\n' || c == '\r'; };
    while (!_rest.empty() && isSpace(_rest.front())) {
      _rest.remove_prefix(1);
    }
  }

  bool takeTag(std::string_view tag) {
    skipSpace();
    return take(tag);
  }

  /// Puts the text before `end` into `_text`.
  bool takeText(std::string_view end) {
    std::size_t length = 0;
    while (const std::size_t more = plainLength(_rest.substr(length))) {
      length += more;
    }
    _text = _rest.substr(0, length);
    _rest.remove_prefix(length);
    return take(end);
  }

  /// Of some of the plain characters at the front.
  static std::size_t plainLength(std::string_view text) {
    std::size_t length = 0;
    while (length < text.size() && kIsPlain[static_cast<std::uint8_t>(text[length])]) {
      ++length;
    }
    const std::string_view rest = text.substr(length);
    if (length != 0 || rest.empty()) {
      return length;
    }
    if (rest[0] == ']') {
      return rest.starts_with("]]>") ? 0 : 1;
    }
    return static_cast<std::uint8_t>(rest[0]) < 0x80 ? 0 : xmlCharacterLength(rest);
  }

  template <typename T>
  static bool store(std::optional<T> content, PropertyValue& value) {
    if (content) {
      value = *std::move(content);
    }
    return content.has_value();
  }

  std::string_view _rest;
  std::string_view _text;
};

}  // namespace

std::optional<PropertyValue> readPlainPtree(std::string_view document) {
  PropertyValue value = false;
  return PlainPtreeReader(document).readDocument(value) ? std::optional(std::move(value))
                                                        : std::nullopt;
}

}  // namespace vesprun
