#include "platform/host/documents/XmlText.h"

#include <gtest/gtest.h>

#include <string>

namespace vesprun {
namespace {

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
