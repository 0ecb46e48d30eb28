#include "NANDInfo/parsers/APIErrorMessage.h"
#include "common/ProcessState.h"

#include <gtest/gtest.h>

namespace vesprun {
namespace {

TEST(APIErrorMessage, KeepsTheFirstTextCutAt1023Bytes) {
  ProcessState::startAfresh();
  EXPECT_EQ(GetAPIErrorMessage(), "NA");
  SetAPIErrorMessage("open: %s failed with 0x%x", "controller", 0xE00002C2U);
  SetAPIErrorMessage("second");
  EXPECT_EQ(GetAPIErrorMessage(), "open: controller failed with 0xe00002c2");

  ProcessState::startAfresh();
  SetAPIErrorMessage("%s", std::string(1023, 'x').append("yz").c_str());
  EXPECT_EQ(GetAPIErrorMessage(), std::string(1023, 'x'));

  ProcessState::startAfresh();
  SetAPIErrorMessage("%s", "");
  SetAPIErrorMessage("second");
  EXPECT_EQ(GetAPIErrorMessage(), "");
  ProcessState::startAfresh();
}

}  // namespace
}  // namespace vesprun
