#include "platform/host/documents/QuotedText.h"

#include <gtest/gtest.h>

namespace vesprun {
namespace {

TEST(QuotedText, LeavesNoControlCharacterInAText) {
  EXPECT_EQ(printableText("plain \xC3\xA4\xE2\x82\xAC \"\\"), "plain \xC3\xA4\xE2\x82\xAC \"\\");
  EXPECT_EQ(printableText("\x1B[2J\r\n\t\x7F"), "\\x1b[2J\\x0d\\x0a\\x09\\x7f");
  EXPECT_EQ(printableText("\xC2\x9B\xC2\xA0\xFF"), "\\xc2\\x9b\xC2\xA0\\xff");
  EXPECT_EQ(printableText(std::string(100, 'a')), std::string(100, 'a'));
  EXPECT_EQ(quotedText("a\nb"), "\"a\\x0ab\"");
  EXPECT_EQ(quotedText(std::string(40, 'a')), '"' + std::string(40, 'a') + '"');
  EXPECT_EQ(quotedText(std::string(41, 'a')), '"' + std::string(40, 'a') + "...\"");
}

}  // namespace
}  // namespace vesprun
