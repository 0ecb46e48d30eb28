#include <gmock/gmock.h>

#include <algorithm>
#include <cmath>
#include <limits>

#include "platform/host/documents/XmlText.h"
#include "support/Documents.h"

namespace vesprun {
namespace {

using ::testing::HasSubstr, ::testing::StartsWith;

std::string inPtree(const std::string& content) {
  return "<ptree version=\"1.0\">" + content + "</ptree>";
}

std::string readingError(const std::string& document) {
  std::string error;
  EXPECT_FALSE(readPtree(document, error)) << document.substr(0, 300);
  return error;
}

std::string nestedArrays(std::size_t count) {
  std::string start, end;
  for (std::size_t level = 0; level < count; ++level) {
    start += "<array>";
    end += "</array>";
  }
  return inPtree(start + "<true/>" + end);
}

PropertyDict everything() {
  return {{"name", "text"},
          {"escaped <&>\"'", "a & b < c > d ]]> \"e\" 'f'"},
          {"white", " \t\n\r \r\n"},
          {"", ""},
          {"unicode", "\xC3\xA4\xE2\x82\xAC\xF0\x9F\x98\x80"},
          {"smallest", std::numeric_limits<std::int64_t>::min()},
          {"largest", std::numeric_limits<std::uint64_t>::max()},
          {"tiny", 5e-324},
          {"third", 1.0 / 3},
          {"huge", -1.7976931348623157e308},
          {"single", 0.1F},
          {"infinite", -std::numeric_limits<double>::infinity()},
          {"yes", true},
          {"no", false},
          {"no bytes", Bytes{}},
          {"bytes", Bytes{0, 255, 16, 128}},
          {"date", Date{1709630102, 250'000'000}},
          {"list", PropertyArray{PropertyDict{{"in", 1}}, PropertyArray{}, PropertyDict{}, "x"}}};
}

TEST(PtreeWriter, NamesThePlaceOfWhatADocumentCannotCarry) {
  std::string document = "before";
  std::string error;
  const auto refuses = [&](const PropertyValue& value) {
    EXPECT_FALSE(writePtree(value, document, error));
    EXPECT_EQ(document, "before");
    return error;
  };
  EXPECT_EQ(refuses(PropertyDict{{"a", PropertyArray{1, PropertyDict{{"b", "x\x01"}}}}}),
            "\"a\" > [1] > \"b\": the string \"x\\x01\" holds what XML cannot carry");
  EXPECT_EQ(refuses(PropertyDict{{"bad\xFF", 1}}),
            "\"bad\\xff\": the key \"bad\\xff\" holds what XML cannot carry");
  EXPECT_THAT(refuses("\xEF\xBF\xBE"), HasSubstr("XML"));
  EXPECT_THAT(refuses(PropertyArray{Date{std::numeric_limits<std::int64_t>::max(), 0}}),
              StartsWith("[0]: a date"));
  PropertyValue nested(1);
  for (int level = 0; level < 200; ++level) {
    nested = PropertyArray{std::move(nested)};
  }
  EXPECT_EQ(valueOfPtree(ptreeOf(nested)), nested);
  EXPECT_THAT(refuses(PropertyArray{nested}),
              HasSubstr("\xE2\x80\xA6: nested deeper than 200 levels"));
}

TEST(PtreeWriter, WritesTheSameDocumentInPieces) {
  PropertyArray elements;
  const PropertyDict entries{{"first", 1}};
  const PtreeDocument document{entries, "last", [&elements](const auto& take) {
                                 for (const PropertyValue& element : elements) {
                                   if (!take(*element.dict())) {
                                     return;
                                   }
                                 }
                               }};
  std::string error;
  for (const std::size_t count : {0U, 1U, 50000U}) {
    elements.assign(count, PropertyDict{{"text", "some text of an element"}});
    std::vector<std::string> pieces;
    EXPECT_TRUE(isPtree(document, error)) << error;
    writePtree(document, [&pieces](std::string_view piece) { pieces.emplace_back(piece); });
    std::string text;
    for (const std::string& piece : pieces) {
      EXPECT_LT(piece.size(), (std::size_t{1} << 20) + 1'000);
      text += piece;
    }
    EXPECT_EQ(text, ptreeOf(PropertyDict{{"first", 1}, {"last", elements}}));
  }
  elements[1] = PropertyDict{{"text", "\x01"}};
  elements[2] = PropertyDict{{"text", "\x02"}};
  EXPECT_FALSE(isPtree(document, error));
  EXPECT_THAT(error, StartsWith("\"last\" > [1] > \"text\": the string"));
}

TEST(PtreeReader, ReadsBackEveryKindOfValue) {
  const PropertyDict original = everything();
  const PropertyValue read = valueOfPtree(ptreeOf(original));
  EXPECT_EQ(read, PropertyValue(original));
  ASSERT_NE(read.dict(), nullptr);
  auto entry = read.dict()->begin();
  for (const auto& [key, value] : original) {
    EXPECT_EQ((entry++)->first, key);  // in order
  }
  EXPECT_TRUE(std::isnan(valueOfPtree(ptreeOf(std::nan(""))).number()->asDouble()));
  EXPECT_TRUE(std::isnan(valueOfPtree(ptreeOf(-std::nan(""))).number()->asDouble()));
  const auto kindOf = [](const char* text) { return valueOfPtree(inPtree(text)).number()->kind(); };
  EXPECT_EQ(kindOf("<integer>9223372036854775807</integer>"), NumberKind::Int64);
  EXPECT_EQ(kindOf("<integer>9223372036854775808</integer>"), NumberKind::UInt64);
  EXPECT_EQ(kindOf("<real>2</real>"), NumberKind::Double);
}

TEST(PtreeReader, TakesWhatOtherWritersMayWrite) {
  const PropertyValue one(PropertyArray{1});
  for (const std::string start :
       {"", "\xEF\xBB\xBF", "\n", "<?xml version='1.0'?>",
        "<?xml version = \"1.0\" encoding='utf-8' standalone=\"yes\" ?>\r\n"}) {
    EXPECT_EQ(valueOfPtree(start + inPtree("<array><integer>1</integer></array>") + " \n"), one);
  }
  EXPECT_EQ(
      valueOfPtree("<ptree  version = '1.0' >\r\n<array >\r\n\t<integer >1</integer >\n</array>"
                   "</ptree >"),
      one);
  EXPECT_EQ(
      valueOfPtree(inPtree("<string>&#x41;&#66;&lt;&gt;&amp;&quot;&apos;&#x1F600;&#10;</string>")),
      PropertyValue("AB<>&\"'\xF0\x9F\x98\x80\n"));
  EXPECT_EQ(valueOfPtree(inPtree("<string>a\r\nb\rc&#13;\n</string>")),
            PropertyValue("a\nb\nc\r\n"));
  EXPECT_EQ(valueOfPtree(inPtree("<data>\n\tAQ\n ID\t</data>")), PropertyValue(Bytes{1, 2, 3}));
  EXPECT_EQ(valueOfPtree(inPtree("<array><string/><string></string><true></true><data/></array>")),
            PropertyValue(PropertyArray{"", "", true, Bytes{}}));
  EXPECT_EQ(valueOfPtree(inPtree("<dict>\n</dict>")), PropertyValue(PropertyDict{}));
  const PropertyValue repeated =
      valueOfPtree(inPtree("<dict><key>a</key><true/><key> </key><string> </string>"
                           "<key>a</key><string>\n</string></dict>"));
  EXPECT_EQ(repeated, PropertyValue(PropertyDict{{"a", "\n"}, {" ", " "}}));
  EXPECT_EQ(repeated.dict()->begin()->first, "a");
}

TEST(PtreeReader, SkipsCommentsWhereverXmlAllowsThem) {
  EXPECT_EQ(
      valueOfPtree("<?xml version=\"1.0\"?><!-- a > b --><ptree version=\"1.0\"><!----><dict><!--"
                   "<x>&y;--><key>a<!--b-->c</key><!-- \xC3\xA4 -->\n<array><!-- \n -->"
                   "<true><!-- - --></true><integer>1<!--2-->3</integer></array></dict><!-- -->"
                   "</ptree>\n<!-- end -->\n"),
      PropertyValue(PropertyDict{{"ac", PropertyArray{true, 13}}}));
  EXPECT_THAT(readingError(inPtree("<!-- a\n\n --><string>\n<!--\n-->&b;</string>")),
              StartsWith("line 5: an unknown entity"));
}

/// Longer than a piece of the document that the parser is given at once.
TEST(PtreeReader, ReadsLongTextsAndMarkupWhole) {
  std::string text;
  for (int line = 0; text.size() < 3'000'000; ++line) {
    text += std::to_string(line) + "\r\n\xE2\x82\xAC";
  }
  std::string expected = text;
  std::erase(expected, '\r');
  EXPECT_TRUE(valueOfPtree(inPtree("<string>" + text + "<!--" + text + "--></string>")) ==
              PropertyValue(expected));
  const auto lines = std::count(text.begin(), text.end(), '\n');
  EXPECT_EQ(readingError(inPtree("<string>" + text + "&bad;</string>")),
            "line " + std::to_string(lines + 1) + ": an unknown entity");
  EXPECT_EQ(readingError(inPtree("<array " + text + "/>")),
            "line 1: <array> cannot have attributes");
  EXPECT_EQ(readingError(std::string(kMaxPtreeSize + 1, ' ')),
            "line 1: the document is longer than 256 MiB");
}

TEST(PtreeReader, RefusesWhatTheGrammarDoesNotKnow) {
  const std::pair<const char*, std::vector<const char*>> cases[] = {
      {"line 1: the key \"a\" has no value", {"<dict><key>a</key></dict>"}},
      {"the key \"a\" has no value", {"<dict><key>a</key><key>b</key><true/></dict>"}},
      {"a value without a key", {"<dict><true/></dict>"}},
      {"a key where a value is expected", {"<array><key>a</key></array>"}},
      {"text outside of a value", {"<dict>text</dict>", "<array>&#32;</array>", "<true/>text"}},
      {"a document without a value", {""}},
      {"more than one value", {"<true/><true/>"}},
      {"an element inside <string>", {"<string><true/></string>"}},
      {"malformed comment", {"<string>a<!-- b -- c --></string>", "<!-- a --->", "<!-- a"}},
      {"a ptree document has no DOCTYPE", {"<!DOCTYPE ptree><true/>"}},
      {"a ptree document holds no CDATA sections", {"<string><![CDATA[a]]></string>"}},
      {"a ptree document holds no processing instructions", {"<?php ?><true/>"}},
      {"<string> cannot have attributes", {"<string id=\"1\">a</string>"}},
      {"unknown element \"text\"", {"<text>a</text>"}},
      {"unknown element \"String\"", {"<String>a</String>"}},
      {"unknown element \"ptree\"", {"<ptree version=\"1.0\"><true/></ptree>"}},
      {"malformed tag", {"< string>a</string>"}},
      {"<string> is not ended by \"</array>\"", {"<string>a</array>"}},
      {"<dict> is not ended by \"</array>\"", {"<dict></array>"}},
      {"<true> is not empty", {"<true> </true>"}},
      {"unknown entity", {"<string>a&nbsp;b</string>", "<string>a & b</string>"}},
      {"XML does not allow",
       {"<string>&#0;</string>", "<string>&#xD800;</string>", "<string>&#4294967361;</string>",
        "<string>&#;</string>", "<string>\x01</string>"}},
      {"malformed character reference", {"<string>&#X41;</string>", "<string>&#1a;</string>"}},
      {"\"]]>\" in a text", {"<string>a]]>b</string>"}},
      {"not UTF-8", {"<string>\xFF</string>"}},
      {"\"\" is no integer of 64 bits", {"<integer></integer>"}},
      {"no integer",
       {"<integer>+1</integer>", "<integer> 1</integer>", "<integer>0x10</integer>",
        "<integer>-9223372036854775809</integer>", "<integer>18446744073709551616</integer>"}},
      {" is no real number that a double can hold",
       {"<real>1e999</real>", "<real>infinity</real>", "<real>0x1p3</real>", "<real>1.5 </real>",
        "<real/>"}},
      {"is not base64",
       {"<data>AQI</data>", "<data>AQ==AQ==</data>", "<data>A===</data>", "<data>AR==</data>",
        "<data>A*==</data>"}},
      {"\"2024-02-30T00:00:00Z\" is not a date", {"<date>2024-02-30T00:00:00Z</date>"}}};
  for (const auto& [message, contents] : cases) {
    for (const char* content : contents) {
      EXPECT_THAT(readingError(inPtree(content)), HasSubstr(message)) << content;
    }
  }
}

TEST(PtreeReader, RefusesWhatIsNoPtreeDocument) {
  const std::pair<const char*, std::vector<const char*>> cases[] = {
      {"line 1: the document does not begin with <ptree>",
       {"", "plain", "<", "<ptreeversion=\"1.0\"><true/>", "<dict></dict>", "<!-- a --><true/>"}},
      {"line 1: <ptree> does not say version=\"1.0\"",
       {"<ptree>", "<ptree><true/></ptree>", "<ptree version=\"2.0\"><true/></ptree>"}},
      {"line 1: a document without a value", {"<ptree version=\"1.0\"/>"}},
      {"line 1: malformed <ptree> tag",
       {"<ptree version=\"1.0\" x=\"y\"><true/></ptree>", "<ptree version=\"1.0\"/ >"}},
      {"line 1: the XML declaration does not say version 1.0",
       {"<?xml?><ptree version=\"1.0\">",
        "<?xml version=\"1.1\"?><ptree version=\"1.0\"><true/></ptree>"}},
      {"line 1: the encoding is not UTF-8",
       {"<?xml version=\"1.0\" encoding=\"UTF-16\"?><ptree version=\"1.0\"><true/></ptree>"}},
      {"line 1: malformed XML declaration",
       {"<?xml version=\"1.0\"encoding=\"UTF-8\"?><ptree version=\"1.0\"><true/></ptree>"}},
      {"line 1: something follows the end of the document",
       {"<ptree version=\"1.0\"><true/></ptree><ptree version=\"1.0\"><true/></ptree>",
        "<ptree version=\"1.0\"><true/></ptree>x"}},
      {"line 1: a ptree document holds no processing instructions", {" <?xml version=\"1.0\"?>"}},
  };
  for (const auto& [message, documents] : cases) {
    for (const char* document : documents) {
      EXPECT_EQ(readingError(document), message) << document;
    }
  }
  for (const char* trailing : {"x", "<ptree version=\"1.0\"/>", "<!-- a --><?x?>", "&amp;", "<!"}) {
    EXPECT_EQ(readingError(inPtree("<true/>") + "\n" + trailing),
              "line 2: something follows the end of the document");
  }
  EXPECT_EQ(readingError("<!DOCTYPE a [<!ENTITY b \"c\">]>" + inPtree("<string>&b;</string>")),
            "line 1: a ptree document has no DOCTYPE");
  std::string utf16;
  for (const char c : inPtree("<true/>")) {
    utf16 += {c, '\0'};
  }
  for (const std::string& document : {utf16, "\xFF\xFE" + utf16}) {
    EXPECT_EQ(readingError(document), "line 1: the document does not begin with <ptree>");
  }
}

TEST(PtreeReader, NamesTheLine) {
  const std::string start = "<?xml version=\"1.0\"?>\r\n<ptree version=\"1.0\">\n<dict>\n";
  EXPECT_THAT(readingError(start + "<key>a</key>\n<integer>1x</integer>\n</dict></ptree>"),
              StartsWith("line 5: \"1x\" is no integer"));
  EXPECT_THAT(readingError(start + "<key>a&amp;\nb</key>\n<string>\n\n&bad;</string>"),
              StartsWith("line 8: an unknown entity"));
  EXPECT_THAT(readingError(start + "<key>a</key>\n</dict>\n</ptree>"),
              StartsWith("line 4: the key"));
  EXPECT_EQ(readingError(start + "<key\n\nid></key>"), "line 4: <key> cannot have attributes");
  EXPECT_EQ(readingError(start + "\n\n"), "line 6: the document ends early");
  EXPECT_EQ(readingError(nestedArrays(201)), "line 1: nested deeper than 200 levels");
  EXPECT_THAT(readingError(nestedArrays(1'000'000)), HasSubstr("nested"));
  valueOfPtree(nestedArrays(200));
}

TEST(PtreeReader, RefusesADocumentCutAtAnyByte) {
  const std::string document = ptreeOf(everything());
  const std::size_t end = document.size() - 1;  // without the last line feed it is complete
  for (std::size_t size = 0; size < end; ++size) {
    EXPECT_THAT(readingError(document.substr(0, size)), StartsWith("line ")) << size;
  }
  valueOfPtree(document.substr(0, end));
}

TEST(XmlText, TakesEveryWidthOfCharacterAtItsEnds) {
  for (const char* text :
       {"", "plain", "\t\n\r ", "\x7F", "\xC2\x80", "\xDF\xBF", "\xE0\xA0\x80", "\xED\x9F\xBF",
        "\xEE\x80\x80", "\xEF\xBF\xBD", "\xF0\x90\x80\x80", "\xF4\x8F\xBF\xBF"}) {
    EXPECT_TRUE(isXmlText(text)) << text;
  }
}

TEST(XmlText, RefusesControlsSurrogatesNonCharactersAndMalformedUtf8) {
  for (const char* text :
       {"\x01", "\x1F", "\xEF\xBF\xBE", "\xEF\xBF\xBF", "\xED\xA0\x80", "\xED\xBF\xBF", "\x80",
        "\xC0\xAF", "\xC1\xBF", "\xE0\x9F\xBF", "\xF0\x8F\xBF\xBF", "\xF4\x90\x80\x80", "\xF5",
        "\xC3", "\xC3(", "\xE2\x82", "\xE2\x82(", "\xF0\x9F\x98", "\xF0(\x98\x80"}) {
    EXPECT_FALSE(isXmlText(text)) << text;
    EXPECT_EQ(xmlTextLength("good" + std::string(text) + "after"), 4U);
  }
  EXPECT_FALSE(isXmlText(std::string("a\0b", 3)));
}

}  // namespace
}  // namespace vesprun
