#include "platform/host/documents/PtreeSyntax.h"

#include <algorithm>
#include <array>
#include <cstdint>
#include <utility>

#include "platform/host/documents/NestedPlace.h"
#include "platform/host/documents/QuotedText.h"
#include "platform/host/documents/XmlText.h"

namespace vesprun {
namespace {

constexpr std::array<std::pair<std::string_view, PtreeElement>, 10> kElements = {{
    {"dict", PtreeElement::Dict},
    {"array", PtreeElement::Array},
    {"key", PtreeElement::Key},
    {"string", PtreeElement::String},
    {"integer", PtreeElement::Integer},
    {"real", PtreeElement::Real},
    {"true", PtreeElement::True},
    {"false", PtreeElement::False},
    {"data", PtreeElement::Data},
    {"date", PtreeElement::Date},
}};

constexpr bool isSpace(char c) { return c == ' ' || c == '\t' || c == '\n' || c == '\r'; }

constexpr bool isNameCharacter(char c) {
  return (c >= 'a' && c <= 'z') || (c >= 'A' && c <= 'Z') || (c >= '0' && c <= '9') || c == '_' ||
         c == ':' || c == '-' || c == '.' || static_cast<std::uint8_t>(c) >= 0x80;
}

class SyntaxCheck {
  struct Level {
    bool isDict;
    bool awaitsValue;  ///< a dictionary after a key
  };

 public:
  SyntaxCheck(std::string_view document, PtreeFault& fault) : _document(document), _fault(fault) {}

  std::optional<std::size_t> run() {
    if (_document.starts_with("\xEF\xBB\xBF")) {
      _at = 3;
    }
    if (_document.substr(_at).starts_with("<?xml") && !takeDeclaration()) {
      return std::nullopt;
    }
    skipSpace();
    const std::size_t rootStart = _at;
    if (!takeRootTag() || !takeContent()) {
      return std::nullopt;
    }
    skipSpace();
    if (_at != _document.size()) {
      fail("something follows the end of the document");
      return std::nullopt;
    }
    return rootStart;
  }

 private:
  bool fail(std::string message) { return failAt(_at, std::move(message)); }
  bool failAt(std::size_t offset, std::string message) {
    _fault = {offset, std::move(message)};
    return false;
  }

  bool atEnd() const { return _at == _document.size(); }
  bool take(std::string_view text) {
    if (!_document.substr(_at).starts_with(text)) {
      return false;
    }
    _at += text.size();
    return true;
  }
  bool skipSpace() {
    const std::size_t before = _at;
    while (!atEnd() && isSpace(_document[_at])) {
      ++_at;
    }
    return _at != before;
  }
  std::string_view takeName() {
    const std::size_t start = _at;
    while (!atEnd() && isNameCharacter(_document[_at])) {
      ++_at;
    }
    return _document.substr(start, _at - start);
  }

  /// Takes `name="value"`; nothing when something else stands here.
  std::optional<std::string_view> takeAttribute(std::string_view name) {
    if (!take(name)) {
      return std::nullopt;
    }
    skipSpace();
    if (!take("=")) {
      return std::nullopt;
    }
    skipSpace();
    const char quote = atEnd() ? '\0' : _document[_at];
    // The values that are allowed are short; what is longer need not be searched for its end.
    const std::string_view rest = _document.substr(_at, 64);
    const std::size_t end = rest.find(quote, 1);
    if ((quote != '"' && quote != '\'') || end == std::string_view::npos) {
      return std::nullopt;
    }
    _at += end + 1;
    return rest.substr(1, end - 1);
  }

  bool takeDeclaration() {
    _at += std::string_view("<?xml").size();
    bool spaced = skipSpace();
    const auto version = takeAttribute("version");
    if (!spaced || version != "1.0") {
      return fail("the XML declaration does not say version 1.0");
    }
    spaced = skipSpace();
    if (_document.substr(_at).starts_with("encoding")) {
      const std::size_t start = _at;
      const auto encoding = takeAttribute("encoding");
      const auto sameLetter = [](char c, char upper) {
        return c == upper || (c >= 'a' && c <= 'z' && c - 'a' + 'A' == upper);
      };
      static constexpr std::string_view kUtf8 = "UTF-8";
      if (!spaced || !encoding ||
          !std::equal(encoding->begin(), encoding->end(), kUtf8.begin(), kUtf8.end(), sameLetter)) {
        return failAt(start, "the encoding is not UTF-8");
      }
      spaced = skipSpace();
    }
    if (spaced && _document.substr(_at).starts_with("standalone")) {
      const auto standalone = takeAttribute("standalone");
      if (standalone != "yes" && standalone != "no") {
        return fail("malformed XML declaration");
      }
      skipSpace();
    }
    return take("?>") || fail("malformed XML declaration");
  }

  bool takeRootTag() {
    const std::size_t start = _at;
    if (!take("<ptree") || (!atEnd() && isNameCharacter(_document[_at]))) {
      return refuseMarkup(start) && failAt(start, "the document does not begin with <ptree>");
    }
    const bool spaced = skipSpace();
    if (!spaced || takeAttribute("version") != "1.0") {
      return failAt(start, "<ptree> does not say version=\"1.0\"");
    }
    skipSpace();
    return take(">") || failAt(start, "malformed <ptree> tag");
  }

  /// Fails with a text of its own for the markup that people expect to work.
  bool refuseMarkup(std::size_t start) {
    const std::string_view rest = _document.substr(start);
    if (rest.starts_with("<!--")) {
      return failAt(start, "a ptree document holds no comments");
    }
    if (rest.starts_with("<![CDATA[")) {
      return failAt(start, "a ptree document holds no CDATA sections");
    }
    if (rest.starts_with("<!")) {
      return failAt(start, "a ptree document has no DOCTYPE");
    }
    if (rest.starts_with("<?")) {
      return failAt(start, "a ptree document holds no processing instructions");
    }
    return true;
  }

  /// Everything up to and with "</ptree>".
  bool takeContent() {
    while (!atEnd()) {
      const char c = _document[_at];
      if (c == '<') {
        if (!takeTag()) {
          return false;
        }
        if (_finished) {
          return true;
        }
      } else if (c == '&') {
        if (!takeReference()) {
          return false;
        }
      } else if (!takeCharacter(c)) {
        return false;
      }
    }
    return fail("the document ends early");
  }

  bool takeCharacter(char c) {
    if (!_inText && !isSpace(c)) {
      return fail("text outside of a value");
    }
    if (c == ']' && _document.substr(_at).starts_with("]]>")) {
      return fail("\"]]>\" in a text");
    }
    const auto byte = static_cast<std::uint8_t>(c);
    const std::size_t length =
        byte >= 0x20 && byte < 0x80 ? 1 : xmlCharacterLength(_document.substr(_at));
    if (length == 0) {
      return fail("a character that is not UTF-8 or that XML does not allow");
    }
    _at += length;
    return true;
  }

  bool takeReference() {
    if (!_inText) {
      return fail("text outside of a value");
    }
    for (const std::string_view entity : {"&amp;", "&lt;", "&gt;", "&quot;", "&apos;"}) {
      if (take(entity)) {
        return true;
      }
    }
    const std::size_t start = _at;
    const bool hexadecimal = take("&#x");
    if (!hexadecimal && !take("&#")) {
      return fail("an unknown entity");
    }
    char32_t codePoint = 0;
    bool digits = false;
    for (; !atEnd() && _document[_at] != ';'; ++_at, digits = true) {
      const char c = _document[_at];
      char32_t digit = 16;
      if (c >= '0' && c <= '9') {
        digit = static_cast<char32_t>(c - '0');
      } else if (c >= 'a' && c <= 'f') {
        digit = static_cast<char32_t>(c - 'a' + 10);
      } else if (c >= 'A' && c <= 'F') {
        digit = static_cast<char32_t>(c - 'A' + 10);
      }
      if (digit >= (hexadecimal ? 16U : 10U)) {
        return failAt(start, "a malformed character reference");
      }
      // Held beyond the last code point, so that no number of digits wraps around.
      codePoint = std::min<char32_t>(codePoint * (hexadecimal ? 16 : 10) + digit, 0x110000);
    }
    if (!digits || !take(";") || !isXmlCharacter(codePoint)) {
      return failAt(start, "a reference to a character that XML does not allow");
    }
    return true;
  }

  bool takeTag() {
    const std::size_t start = _at;
    if (!refuseMarkup(start)) {
      return false;
    }
    ++_at;
    return take("/") ? takeEndTag(start) : takeStartTag(start);
  }

  bool takeEndTag(std::size_t start) {
    const std::string_view name = takeName();
    skipSpace();
    const std::string_view expected = expectedEnd();
    if (name != expected) {
      return failAt(start, '<' + std::string(expected) + "> is not ended by " +
                               quotedText("</" + std::string(name.substr(0, 64)) + '>'));
    }
    if (!take(">")) {
      return failAt(start, "malformed tag");
    }
    if (_inText) {
      _inText = false;
      _lastText = _document.substr(_textStart, start - _textStart);
    } else if (_level == 0) {
      _finished = true;
    } else {
      --_level;
      return !_levels[_level].awaitsValue || failAtKey();
    }
    return true;
  }

  std::string_view expectedEnd() const {
    if (_inText) {
      return _textName;
    }
    return _level == 0 ? "ptree" : _levels[_level - 1].isDict ? "dict" : "array";
  }

  /// Whether an element may stand at this place of its dictionary, array or document.
  bool takePlace(PtreeElement element, std::size_t start) {
    if (_level == 0 && std::exchange(_hasValue, true)) {
      return failAt(start, "more than one value");
    }
    const bool isKey = element == PtreeElement::Key;
    if (_level == 0 || !_levels[_level - 1].isDict) {
      return !isKey || failAt(start, "a key where a value is expected");
    }
    bool& awaitsValue = _levels[_level - 1].awaitsValue;
    if (isKey == awaitsValue) {
      return isKey ? failAtKey() : failAt(start, "a value without a key");
    }
    awaitsValue = isKey;
    if (isKey) {
      _keyStart = start;
      _lastText = {};
    }
    return true;
  }

  bool failAtKey() {
    return failAt(_keyStart, "the key " + quotedText(_lastText) + " has no value");
  }

  bool takeStartTag(std::size_t start) {
    const std::string_view name = takeName();
    if (_inText) {
      return failAt(start, "an element inside <" + std::string(_textName) + '>');
    }
    const std::optional<PtreeElement> element = ptreeElement(name);
    if (!element) {
      return failAt(start, name.empty() ? "malformed tag" : "unknown element " + quotedText(name));
    }
    if (!takePlace(*element, start)) {
      return false;
    }
    const bool spaced = skipSpace();
    const bool empty = take("/");
    if (!take(">")) {
      return failAt(start, spaced && !empty ? '<' + std::string(name) + "> cannot have attributes"
                                            : "malformed tag");
    }
    const bool container = element == PtreeElement::Dict || element == PtreeElement::Array;
    if (container && _level == kMostNestedLevels) {
      return failAt(start, kNestedTooDeeply);
    }
    if (empty) {
      return true;
    }
    if (container) {
      _levels[_level++] = {element == PtreeElement::Dict, false};
    } else {
      _inText = true;
      _textName = name;
      _textStart = _at;
    }
    return true;
  }

  std::string_view _document;
  PtreeFault& _fault;
  std::size_t _at = 0;
  std::array<Level, kMostNestedLevels> _levels{};  ///< the containers around the current place
  std::size_t _level = 0;                          ///< how many those are
  bool _inText = false;                            ///< in an element that holds no others
  std::string_view _textName;                      ///< the name of that element
  std::size_t _textStart = 0;
  std::string_view _lastText;  ///< after a key and before its value: the key as it is written
  std::size_t _keyStart = 0;
  bool _hasValue = false;
  bool _finished = false;
};

}  // namespace

std::optional<PtreeElement> ptreeElement(std::string_view name) {
  for (const auto& [known, element] : kElements) {
    if (name == known) {
      return element;
    }
  }
  return std::nullopt;
}

std::optional<std::size_t> checkPtreeSyntax(std::string_view document, PtreeFault& fault) {
  return SyntaxCheck(document, fault).run();
}

}  // namespace vesprun
