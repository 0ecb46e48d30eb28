#include "telemetry/NVRAMStatistics.h"

#include "telemetry/TodaysScalars.h"

namespace vesprun {
namespace {

TEST(NVRAMStatistics, AreWhatTheRegistryHoldsWhateverTheEventServiceDoes) {
  const struct {
    std::string entries;
    PropertyDict statistics;
    bool sendsEvent;
  } cases[] = {
      {R"("registry": [{"class": "Other", "properties": {"Generation": 1234}}])", {}, false},
      {R"("registry": [{"class": "DevRegDTNVRAMDiags", "properties": {"Other": 1}}])", {}, false},
      {R"("registry": [{"class": "DevRegDTNVRAMDiags", "properties": {"Generation": 1234}}])",
       {{"norwrites", 1234}},
       true},
      {R"("registry": [{"class": "Bus", "children": [{"class": "DevRegDTNVRAMDiags",
            "properties": {"Version": "2.1", "CommonUsed": 5},
            "children": [{"class": "Bank",
                          "properties": {"SystemUsed": 0.5, "CommonUsed": 6}}]}]}])",
       {{"commonused", 5}, {"systemused", 0.5}, {"version", "2.1"}},
       true},
      {R"("registry": [{"class": "DevRegDTNVRAMDiags", "properties": {"Version": 1}}],
          "events": {"available": false})",
       {{"version", 1}},
       false}};
  for (const auto& c : cases) {
    TestDevice device(deviceWith(c.entries));
    EXPECT_EQ(gatherNVRAMStats(), c.statistics) << c.entries;
    const std::vector<PropertyDict> events = device.lines("events.jsonl");
    ASSERT_EQ(events.size(), c.sendsEvent ? 1U : 0U) << c.entries;
    if (c.sendsEvent) {
      EXPECT_EQ(*events[0].find("event"), "com.quill.massStorage.NANDInfo.NORWrites");
      EXPECT_EQ(*events[0].find("payload"), PropertyValue(c.statistics));
    }
  }
}

}  // namespace
}  // namespace vesprun
