#include "platform/host/DeviceDescription.h"

namespace vesprun {
namespace {

std::string errorOf(const std::string& text) {
  std::string error;
  return readDeviceDescription(text, error) ? "accepted" : error;
}

TEST(DeviceDescription, ReadsEveryEntry) {
  std::string error;
  const auto device = readDeviceDescription(R"({
    "clock": "2024-03-05T09:15:02Z", "timeZone": "Europe/Berlin", "logLevel": "notice",
    "system": {"osVersion": "7.1", "hardwareModel": "H1"},
    "properties": {"InternalBuild": true, "DiskUsage": null, "InverseDeviceID": "ID"},
    "userVolume": {"blockSize": 4096, "blocks": 18446744073709551615, "available": 7},
    "submission": {"enabled": false, "fails": true},
    "logBlacklist": ["a", 5],
    "events": {"available": false, "used": ["one"], "fails": ["two"]},
    "apps": [{"bundle": "b", "user": true}],
    "languages": {"preferred": ["de"], "localizations": [], "country": null},
    "supportLibrary": {"available": true, "missing": ["f"]},
    "purgeable": null,
    "kernel": {"pageSize": 16384, "ticks": null, "eccError": 16, "snapshot": "s.bin",
               "variables": {"a": {"u32": 4294967295}, "b": {"u64": 9}, "c": "text",
                             "d": {"data": "AQI="}}},
    "registry": [{"class": "C", "conformsTo": ["D"], "matching": false,
                  "properties": {"p": {"data": "/w=="}}, "children": [{"class": "E"}],
                  "userClient": {"openError": 1, "closeError": 2,
                    "tunnel": [{"opcode": 13, "file": "f", "size": 8, "dataError": 3758097084}],
                    "contentDeletion": {"value": 1},
                    "scalarMethods": {"3": {"LPEM": 5}}}}],
    "channels": [{"name": "n", "value": -1}],
    "usage": {"records": [{"procName": "p"}], "delaySeconds": 2}
  })",
                                            error);
  ASSERT_TRUE(device) << error;
  EXPECT_EQ(device->logLevel, LogLevel::Notice);
  EXPECT_TRUE(device->properties.diskUsage.isNull);
  EXPECT_EQ(device->userVolume.value->blocks, 18446744073709551615U);
  EXPECT_EQ(device->logBlacklist, (PropertyArray{"a", 5}));
  EXPECT_EQ(device->events.used->count("one"), 1U);
  EXPECT_TRUE(device->languages.country.isNull);
  EXPECT_TRUE(device->purgeableServiceAvailable);
  EXPECT_FALSE(device->purgeable);
  EXPECT_TRUE(device->kernel.ticks.isNull);
  EXPECT_EQ(std::get<std::uint32_t>(device->kernel.variables.at("a")), 4294967295U);
  EXPECT_EQ(std::get<Bytes>(device->kernel.variables.at("d")), (Bytes{1, 2}));
  const RegistryEntryDescription& entry = device->registry.at(0);
  EXPECT_EQ(entry.children.at(0).className, "E");
  EXPECT_EQ(entry.userClient->tunnel.at(0).dataError, 3758097084U);
  EXPECT_EQ(entry.userClient->scalarMethods.at(3).at(0x4C50454D), 5U);
  EXPECT_EQ(device->channels.at(0).categories, 256U);
  EXPECT_EQ(device->usage.value->delaySeconds, 2.0);
}

TEST(DeviceDescription, NamesTheEntryThatIsWrong) {
  const std::pair<const char*, const char*> cases[] = {
      {R"([])", "not a dictionary"},
      {R"({"colour": 1})", "colour: unknown entry"},
      {R"({"clock": "today"})", "clock: not a date such as 2024-03-05T09:15:02Z"},
      {R"({"logLevel": "loud"})",
       "logLevel: not a log level (error, default, notice, info, debug)"},
      {R"({"system": {"osVersion": 5}})", "system.osVersion: not a string"},
      {R"({"userVolume": {"blocks": 1}})", "userVolume.blockSize: missing"},
      {R"({"userVolume": {"blockSize": -1, "blocks": 1, "available": 1}})",
       "userVolume.blockSize: out of range"},
      {R"({"apps": [{"bundle": "a", "user": true}, {"bundle": "b"}]})", "apps[1].user: missing"},
      {R"({"kernel": {"variables": {"v": {"u32": 4294967296}}}})",
       "kernel.variables.v.u32: out of range"},
      {R"({"kernel": {"variables": {"v": {"u32": 1, "u64": 1}}}})",
       "kernel.variables.v: neither a string nor one of u32, u64 and data"},
      {R"({"registry": [{"class": "C", "userClient": {"tunnel": [{"opcode": "x"}]}}]})",
       "registry[0].userClient.tunnel[0].opcode: not an integer"},
      {R"({"registry": [{"class": "C", "userClient": {"scalarMethods": {"3": {"LP": 1}}}}]})",
       "registry[0].userClient.scalarMethods.3.LP: not a four-character code"},
      {R"({"usage": {"delaySeconds": -1}})", "usage.delaySeconds: negative"},
  };
  for (const auto& [text, expected] : cases) {
    EXPECT_EQ(errorOf(text), expected) << text;
  }
  EXPECT_THAT(errorOf("{\n\"clock\": }"), testing::HasSubstr("line 2"));
  EXPECT_NE(errorOf(std::string(100'000, '[')), "accepted");
}

}  // namespace
}  // namespace vesprun
