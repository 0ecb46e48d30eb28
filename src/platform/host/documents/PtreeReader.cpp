#include "platform/host/documents/PtreeReader.h"

#include <expat.h>
#include <strings.h>

#include <algorithm>
#include <array>
#include <cctype>
#include <cstdint>
#include <exception>
#include <memory>
#include <new>
#include <utility>
#include <vector>

#include "common/Calendar.h"
#include "platform/host/documents/Base64.h"
#include "platform/host/documents/NestedPlace.h"
#include "platform/host/documents/NumberText.h"
#include "platform/host/documents/QuotedText.h"
#include "platform/host/documents/XmlText.h"

namespace vesprun {
namespace {

enum class Element { Dict, Array, Key, String, Integer, Real, True, False, Data, Date };

constexpr std::array<std::string_view, 10> kElementNames = {
    "dict", "array", "key", "string", "integer", "real", "true", "false", "data", "date"};

constexpr std::size_t kParsedPiece = 256 * 1024;
constexpr std::string_view kWhiteSpace = " \t\n\r";
constexpr const char* kNoPtree = "the document does not begin with <ptree>";
constexpr const char* kNoXmlVersion = "the XML declaration does not say version 1.0";
constexpr const char* kNoVersion = "<ptree> does not say version=\"1.0\"";
constexpr const char* kTextOutside = "text outside of a value";

constexpr std::pair<std::string_view, const char*> kRefusedMarkup[] = {
    {"<![CDATA[", "a ptree document holds no CDATA sections"},
    {"<!--", "a malformed comment"},
    {"<!", "a ptree document has no DOCTYPE"},
    {"<?", "a ptree document holds no processing instructions"}};

struct Fault {
  std::size_t line;
  std::string message;
};

/// Parses as the first type that can hold it.
template <typename... Types>
std::optional<Number> parseNumber(std::string_view text) {
  std::optional<Number> number;
  const auto holds = [&](auto value) {
    const bool isParsed = parseWholeText(text, value);
    number = isParsed ? std::optional<Number>(value) : std::nullopt;
    return isParsed;
  };
  static_cast<void>((holds(Types()) || ...));
  return number;
}

/// Builds the value as expat goes through the document.
class PtreeParser {
 public:
  /// `visit`, which may be empty, must outlive the object.
  explicit PtreeParser(const PtreeEntryVisitor& visit)
      : _expat(XML_ParserCreate("UTF-8")), _visit(visit) {
    if (!_expat) {
      throw std::bad_alloc();
    }
    XML_SetUserData(_expat.get(), this);
    XML_SetXmlDeclHandler(_expat.get(), handle<&PtreeParser::takeDeclaration>);
    XML_SetElementHandler(_expat.get(), handle<&PtreeParser::takeStart>,
                          handle<&PtreeParser::takeEnd>);
    XML_SetCharacterDataHandler(_expat.get(), handle<&PtreeParser::takeText>);
    XML_SetDefaultHandler(_expat.get(), handle<&PtreeParser::takeOther>);
  }

  std::optional<PropertyValue> read(std::string_view document, std::string& error) {
    try {
      parse(document);
      if (_valueFault) {
        throw *std::move(_valueFault);
      }
      return std::move(_value);
    } catch (const Fault& fault) {
      error = "line " + std::to_string(fault.line) + ": " + fault.message;
      return std::nullopt;
    }
  }

 private:
  struct Container {
    bool isDict;
    bool awaitsValue = false;  ///< a dictionary after a key
    std::size_t keyLine = 0;
    std::string key{};
    PropertyDict dict{};
    PropertyArray array{};
  };
  struct Free {
    void operator()(XML_Parser parser) const { XML_ParserFree(parser); }
  };

  /// No exception may cross expat's own code.
  template <auto take, typename... Arguments>
  static void handle(void* self, Arguments... arguments) {
    PtreeParser& parser = *static_cast<PtreeParser*>(self);
    if (parser._exception) {
      return;  // expat still delivers the rest of the token
    }
    const XML_Parser expat = parser._expat.get();
    parser._tokenStart =
        static_cast<std::size_t>(XML_GetCurrentByteIndex(expat) + XML_GetCurrentByteCount(expat));
    try {
      (parser.*take)(arguments...);
    } catch (...) {
      parser._exception = std::current_exception();
      XML_StopParser(expat, XML_FALSE);
    }
  }

  void parse(std::string_view document) {
    if (document.size() > kMaxPtreeSize) {
      throw Fault{1, "the document is longer than 256 MiB"};
    }
    if (document.substr(0, 2).find_first_of(std::string_view("\0\xFE\xFF", 3)) != document.npos) {
      throw Fault{1, kNoPtree};  // UTF-16, which expat would read
    }
    std::size_t taken = 0;
    do {
      // Expat scans an unfinished token anew with every piece.
      const std::string_view piece =
          document.substr(0, std::max(kParsedPiece, taken - _tokenStart));
      taken += piece.size();
      document.remove_prefix(piece.size());
      const XML_Status status = XML_Parse(_expat.get(), piece.data(),
                                          static_cast<int>(piece.size()), document.empty() ? 1 : 0);
      if (_exception) {
        std::rethrow_exception(_exception);
      }
      if (status != XML_STATUS_OK) {
        explain(XML_GetErrorCode(_expat.get()));
      }
    } while (!document.empty());
  }

  std::size_t line() const { return XML_GetCurrentLineNumber(_expat.get()) - _linesIntoToken; }
  [[noreturn]] void fail(std::string message) const { throw Fault{line(), std::move(message)}; }

  /// Notes a malformed value; faults of the grammar take precedence.
  void failValue(std::size_t line, std::string message) {
    if (!_valueFault) {
      _valueFault = {line, std::move(message)};
    }
  }

  void takeDeclaration(const XML_Char* version, const XML_Char* encoding,
                       int /*standalone*/) const {
    if (std::string_view(version) != "1.0") {
      fail(kNoXmlVersion);
    }
    if (encoding != nullptr && strcasecmp(encoding, "UTF-8") != 0) {
      fail("the encoding is not UTF-8");
    }
  }

  void takeStart(const XML_Char* element, const XML_Char** attributes) {
    const std::string_view name(element);
    if (_rootLine == 0) {
      if (name != "ptree") {
        fail(kNoPtree);
      }
      if (attributes[0] == nullptr || std::string_view(attributes[0]) != "version" ||
          std::string_view(attributes[1]) != "1.0") {
        fail(kNoVersion);
      }
      if (attributes[2] != nullptr) {
        fail("malformed <ptree> tag");
      }
      _rootLine = line();
      return;
    }
    _element = place(name);
    if (attributes[0] != nullptr) {
      fail('<' + std::string(name) + "> cannot have attributes");
    }
    if (_element != Element::Dict && _element != Element::Array) {
      _inText = true;
      _elementLine = line();
      _text.clear();
    } else if (_open.size() == kMaxNestedLevels) {
      fail(kNestedTooDeeply);
    } else {
      _open.push_back({_element == Element::Dict});
    }
  }

  /// The element of that name, if it is allowed here.
  Element place(std::string_view name) {
    if (_inText) {
      fail("an element inside <" + std::string(expectedEnd()) + '>');
    }
    const auto* known = std::find(kElementNames.begin(), kElementNames.end(), name);
    if (known == kElementNames.end()) {
      fail(name.empty() ? "malformed tag" : "unknown element " + quotedText(name));
    }
    const auto element = static_cast<Element>(known - kElementNames.begin());
    const bool isKey = element == Element::Key;
    if (_open.empty() && std::exchange(_hasValue, true)) {
      fail("more than one value");
    }
    if (_open.empty() || !_open.back().isDict) {
      if (isKey) {
        fail("a key where a value is expected");
      }
      return element;
    }
    Container& dict = _open.back();
    if (isKey && dict.awaitsValue) {
      failAtKey(dict);
    }
    if (!isKey && !dict.awaitsValue) {
      fail("a value without a key");
    }
    dict.awaitsValue = isKey;
    return element;
  }

  [[noreturn]] static void failAtKey(const Container& dict) {
    throw Fault{dict.keyLine, "the key " + quotedText(dict.key) + " has no value"};
  }

  std::string_view expectedEnd() const {
    return _inText               ? kElementNames[static_cast<std::size_t>(_element)]
           : _open.empty()       ? "ptree"
           : _open.back().isDict ? "dict"
                                 : "array";
  }

  void takeEnd(const XML_Char* /*name*/) {
    if (std::exchange(_inText, false)) {
      if (_element == Element::Key) {
        _open.back().key.swap(_text);
        _open.back().keyLine = _elementLine;
      } else {
        add(textValue());
      }
    } else if (_open.empty()) {
      _finished = true;
      if (!_hasValue) {
        failValue(_rootLine, "a document without a value");
      }
    } else {
      Container& container = _open.back();
      if (container.awaitsValue) {
        failAtKey(container);
      }
      PropertyValue value = container.isDict ? PropertyValue(std::move(container.dict))
                                             : PropertyValue(std::move(container.array));
      _open.pop_back();
      add(std::move(value));
    }
  }

  void add(PropertyValue value) {
    if (_open.empty()) {
      _value = std::move(value);
    } else if (_open.back().isDict) {
      if (_visit) {
        visitEntry(value);
      }
      _open.back().dict.set(std::move(_open.back().key), std::move(value));
    } else {
      _open.back().array.push_back(std::move(value));
    }
  }

  void visitEntry(const PropertyValue& value) {
    _keys.clear();
    for (const Container& container : _open) {
      if (!container.isDict) {
        return;
      }
      _keys.push_back(container.key);
    }
    _visit(_keys, _open.back().keyLine, value);
  }

  PropertyValue textValue() {
    switch (_element) {
      case Element::Integer:
        return parsed(parseNumber<std::int64_t, std::uint64_t>(_text), "is no integer of 64 bits");
      case Element::Real:
        return parsed(parseNumber<double>(_text), "is no real number that a double can hold");
      case Element::Data:
        return parsed(parseBase64(_text), "is not base64");
      case Element::Date:
        return parsed(parseDateText(_text), "is not a date");
      case Element::True:
      case Element::False:
        if (!_text.empty()) {
          failValue(_elementLine,
                    '<' + std::string(kElementNames[static_cast<std::size_t>(_element)]) +
                        "> is not empty");
        }
        return _element == Element::True;
      default:
        return std::string_view(_text);
    }
  }

  template <typename T>
  PropertyValue parsed(std::optional<T> content, const char* complaint) {
    if (!content) {
      failValue(_elementLine, quotedText(_text) + ' ' + complaint);
      return false;
    }
    return *std::move(content);
  }

  void takeText(const XML_Char* bytes, int size) {
    const std::string_view text(bytes, static_cast<std::size_t>(size));
    if (_inText) {
      _text += text;
      return;
    }
    // A character reference to white space is longer in the document than the text; a line end is
    // one byte longer at most.
    const auto length = static_cast<std::size_t>(XML_GetCurrentByteCount(_expat.get()));
    if (text.find_first_not_of(kWhiteSpace) != std::string_view::npos || length > text.size() + 1) {
      fail(kTextOutside);
    }
  }

  /// Comments, white space outside the root element and forbidden markup.
  void takeOther(const XML_Char* bytes, int size) const {
    const std::string_view token(bytes, static_cast<std::size_t>(size));
    if (token.starts_with("<!--") || token.find_first_not_of(kWhiteSpace) == token.npos) {
      return;
    }
    if (_finished) {
      fail("something follows the end of the document");
    }
    failAtMarkup(token);
  }

  void failAtMarkup(std::string_view token) const {
    for (const auto& [start, fault] : kRefusedMarkup) {
      if (token.starts_with(start)) {
        fail(fault);
      }
    }
  }

  /// Explains in the terms of ptree documents why expat refused the input.
  [[noreturn]] void explain(XML_Error error) {
    if (error == XML_ERROR_NO_MEMORY) {
      throw std::bad_alloc();
    }
    int offset = 0;
    int size = 0;
    const char* context = XML_GetInputContext(_expat.get(), &offset, &size);
    const std::string_view input(context, context != nullptr ? static_cast<std::size_t>(size) : 0);
    // Expat points into the token that it refuses; it has handled all tokens before.
    const std::size_t faultInToken =
        static_cast<std::size_t>(XML_GetCurrentByteIndex(_expat.get())) - _tokenStart;
    const auto at = static_cast<std::size_t>(offset);
    const std::string_view token = input.substr(at - std::min(at, faultInToken));
    const std::string_view upToFault = token.substr(0, faultInToken);
    _linesIntoToken =
        static_cast<std::size_t>(std::count(upToFault.begin(), upToFault.end(), '\n'));
    if (_finished) {
      fail("something follows the end of the document");
    }
    if (_rootLine == 0) {
      const std::string_view tag = token.substr(0, token.find('>'));
      const bool saysVersion = tag.find("\"1.0\"") != tag.npos || tag.find("'1.0'") != tag.npos;
      if (token.starts_with("<?xml") && error != XML_ERROR_MISPLACED_XML_PI) {
        fail(saysVersion ? "malformed XML declaration" : kNoXmlVersion);
      }
      failAtMarkup(token);
      fail(!token.starts_with('<') || nameAt(token.substr(1)) != "ptree" ? kNoPtree
           : saysVersion                                                 ? "malformed <ptree> tag"
                                                                         : kNoVersion);
    }
    if (error == XML_ERROR_NO_ELEMENTS) {
      fail("the document ends early");
    }
    if (token.starts_with("</")) {
      const std::string_view name = nameAt(token.substr(2));
      fail(name == expectedEnd() ? "malformed tag"
                                 : '<' + std::string(expectedEnd()) + "> is not ended by " +
                                       quotedText("</" + std::string(name) + '>'));
    }
    if (token.starts_with('<')) {
      failAtMarkup(token);
      failAtStartTag(token.substr(1));
    }
    if (!_inText) {
      fail(kTextOutside);
    }
    if (token.starts_with('&')) {
      const bool malformed = error == XML_ERROR_INVALID_TOKEN && !token.starts_with("&#;") &&
                             !token.starts_with("&#x;");
      fail(!token.starts_with("&#") ? "an unknown entity"
           : malformed              ? "a malformed character reference"
                                    : "a reference to a character that XML does not allow");
    }
    fail(xmlCharacterLength(token.substr(upToFault.size())) == 0
             ? "a character that is not UTF-8 or that XML does not allow"
             : "\"]]>\" in a text");
  }

  [[noreturn]] void failAtStartTag(std::string_view tag) {
    const std::string_view name = nameAt(tag);
    place(name);
    const std::string_view rest = tag.substr(name.size());
    const std::string_view next =
        rest.substr(std::min(rest.find_first_not_of(kWhiteSpace), rest.size()));
    fail(next.size() != rest.size() && !next.starts_with('/')
             ? '<' + std::string(name) + "> cannot have attributes"
             : "malformed tag");
  }

  static std::string_view nameAt(std::string_view text) {
    constexpr std::size_t kMaxLength = 64;
    const auto* end = std::find_if(text.begin(), text.end(), [](char c) {
      const auto byte = static_cast<std::uint8_t>(c);
      return byte < 0x80 && std::isalnum(byte) == 0 &&
             std::string_view("_:-.").find(c) == std::string_view::npos;
    });
    return text.substr(0, std::min(static_cast<std::size_t>(end - text.begin()), kMaxLength));
  }

  std::unique_ptr<XML_ParserStruct, Free> _expat;
  const PtreeEntryVisitor& _visit;
  std::optional<Fault> _valueFault;  ///< the first
  std::exception_ptr _exception;     ///< of a handler
  std::size_t _tokenStart = 0;       ///< of the token after the last one that was handled
  std::size_t _rootLine = 0;         ///< 0 before the root element
  std::size_t _linesIntoToken = 0;   ///< where a fault lies
  bool _hasValue = false;
  bool _finished = false;
  bool _inText = false;  ///< in an element that holds no others
  Element _element{};    ///< the last that began
  std::size_t _elementLine = 0;
  std::string _text;
  std::vector<std::string_view> _keys;  ///< for `_visit`
  std::vector<Container> _open;
  std::optional<PropertyValue> _value;
};

}  // namespace

std::optional<PropertyValue> readPtree(std::string_view bytes, std::string& error) {
  return readPtreeEntries(bytes, error, {});
}

std::optional<PropertyValue> readPtreeEntries(std::string_view bytes, std::string& error,
                                              const PtreeEntryVisitor& visit) {
  return PtreeParser(visit).read(bytes, error);
}

}  // namespace vesprun
