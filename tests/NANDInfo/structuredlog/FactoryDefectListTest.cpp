#include "NANDInfo/structuredlog/FactoryDefectList.h"

#include "buffers/DeviceBuffers.h"
#include "common/TextForm.h"
#include "support/TestDevice.h"

namespace vesprun {
namespace {

TEST(FactoryDefectList, LogsTheCountAndEveryDefect) {
  const Bytes list =
      bytesOf({0xDEADBEEF, 0xFFFFFFFE, 3,                                            //
               0x00030002, 4,          5,          6, 5,          8, 0xABCDEFF6, 1,  //
               0xFFFF8000, 0,          0x80000000, 0, 5,          0, 128,        2,  //
               0,          0,          0,          0, 0xFFFFFFFF, 0, 127,        0xBAD});
  TestDevice device;
  const PropertyValue properties = PropertyDict{{"nand-device-desc", 0xFFFFFFFF}};
  testing::internal::CaptureStderr();
  EXPECT_TRUE(LogFactoryDefectList(list, &properties, "QuillQNS3NVMeController"));
  EXPECT_TRUE(LogFactoryDefectList(list, nullptr, "ORUStorage"));
  EXPECT_EQ(testing::internal::GetCapturedStderr(), "Encountered unexpected defectMode: 0xbad");
  std::string texts;
  for (const PropertyDict& line : device.lines("records.jsonl")) {
    EXPECT_EQ(*line.find("type"), PropertyValue(176));
    texts += textForm(*line.find("record")) + '\n';
  }
  const auto defects = [](const std::string& first, const std::string& second) {
    return "{Bus = 2; CE = 3; CAU = 4; Block = 5; Cycle = 6; Reason = " + first +
           "; Page = 8; Temperature = -10}\n"
           "{Bus = 32768; CE = 65535; CAU = 0; Block = -2147483648; Cycle = 0; Reason = " +
           second +
           "; Page = 0; Temperature = -128}\n"
           "{Bus = 0; CE = 0; CAU = 0; Block = 0; Cycle = 0; Reason = -1; Page = 0; "
           "Temperature = 127}\n";
  };
  EXPECT_EQ(texts, "{Factory Count = -2; com.quill.NANDInfo.nandDesc = -1}\n" +
                       defects("205", "105") + "{Factory Count = -2}\n" + defects("5", "5"));
}

TEST(FactoryDefectList, StaysWithinTheBufferWhereverItEnds) {
  const Bytes list = bytesOf({0, 1, 0xFFFFFFFF, 1, 0, 0, 0, 0, 0, 0, 0, 2, 0, 0, 0, 0, 0, 0, 0});
  TestDevice device;
  std::size_t records = 0;
  for (std::size_t length = 0; length <= list.size(); ++length) {
    const Bytes cut(list.begin(), list.begin() + static_cast<std::ptrdiff_t>(length));
    EXPECT_TRUE(LogFactoryDefectList(cut, nullptr, ""));
    records += length < 8 ? 0U : length < 44 ? 1U : length < 76 ? 2U : 3U;
    EXPECT_EQ(device.lines("records.jsonl").size(), records) << length;
  }
}

}  // namespace
}  // namespace vesprun
