#include "platform/host/device/DeviceDescription.h"

#include <gmock/gmock.h>

namespace vesprun {
namespace {

std::string errorOf(const std::string& text) {
  std::string error;
  return readDeviceDescription(text, error) ? "accepted" : error;
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
      {R"({"apps": [{"bundle": "a", "user": 1}]})", "apps[0].user: not a boolean"},
      {R"({"kernel": {"variables": {"v": {"u32": 4294967296}}}})",
       "kernel.variables.v.u32: out of range"},
      {R"({"kernel": {"variables": {"v": {"u32": 1, "u64": 1}}}})",
       "kernel.variables.v: neither a string nor one of u32, u64 and data"},
      {R"({"registry": [{"class": "C", "userClient": {"tunnel": [{"opcode": "x"}]}}]})",
       "registry[0].userClient.tunnel[0].opcode: not an integer"},
      {R"({"registry": [{"class": "C", "userClient": {"scalarMethods": {"3": {"LP": 1}}}}]})",
       "registry[0].userClient.scalarMethods.3.LP: not a four-character code"},
      {R"({"registry": [{"class": "C", "userClient": {"scalarMethods": {"-3": {"LPEM": 1}}}}]})",
       "registry[0].userClient.scalarMethods.-3: not a method number"},
      {R"({"registry": [{"class": "C", "properties": ["a"]}]})",
       "registry[0].properties: not a dictionary"},
      {R"({"registry": [{"class": "C", "properties": {"a": [1, null]}}]})",
       "registry[0].properties: \"a\" > [1]: null is no value"},
      {R"({"usage": {"delaySeconds": -1}})", "usage.delaySeconds: negative"},
      {R"({"usage": {"delaySeconds": 1e999}})",
       "\"usage\" > \"delaySeconds\": number overflow parsing '1e999'"},
      {R"({"channels": "dead"})", "channels: not an array"},
      {R"({"channels": [{"value": 18446744073709551616}]})",
       "\"channels\" > [0] > \"value\": the integer 18446744073709551616 does not fit 64 bits"},
      {R"({"clock": "today", "clock": "today"})", "\"clock\": there twice"},
  };
  for (const auto& [text, expected] : cases) {
    EXPECT_EQ(errorOf(text), expected) << text;
  }
  EXPECT_EQ(errorOf(R"({"logBlacklist": ["a", 5], "userVolume": {"blockSize": 4294967295,
                        "blocks": 18446744073709551615, "available": 0}})"),
            "accepted");
  EXPECT_THAT(errorOf("{\n\"clock\": }"),
              testing::StartsWith("parse error at line 2, column 10: "));
  EXPECT_NE(errorOf(std::string(100'000, '[')), "accepted");
  EXPECT_EQ(errorOf(std::string(1'000'001, ',')), "more than 1,000,000 values");
}

}  // namespace
}  // namespace vesprun
