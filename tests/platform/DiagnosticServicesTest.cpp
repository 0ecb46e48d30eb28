#include "support/TestDevice.h"

namespace vesprun {
namespace {

TEST(DiagnosticServices, AnswerAsDescribedOrLive) {
  TestDevice device(R"({"system": {"systemID": "S1"}, "kernel": {"snapshot": "kernel/s.bin"}})");
  EXPECT_EQ(device.platform().kernel().captureSnapshot(0x10000), std::nullopt);
  device.write("kernel/s.bin", std::string_view("a\0\xFF", 3));
  EXPECT_EQ(platform().kernel().captureSnapshot(0x10000), (Bytes{'a', 0, 0xFF}));
  DiagnosticHeader& header = platform().diagnosticHeader();
  EXPECT_EQ(header.GetSysIDWithDescription(false), "S1");
  EXPECT_NE(header.GetHardwareModel(), "");
  EXPECT_NE(header.GetSystemVersion(), "");
  EXPECT_EQ(header.GetIncidentID().size(), 36U);
  EXPECT_NE(header.GetIncidentID(), header.GetIncidentID());
}

}  // namespace
}  // namespace vesprun
