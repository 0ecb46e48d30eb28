#include "NANDInfo/structuredlog/NANDLogWriter.h"

#include <limits>

#include "NANDInfo/structuredlog/StructuredLogGlobals.h"
#include "buffers/DeviceBuffers.h"
#include "support/ScarceMemory.h"
#include "support/TestDevice.h"

namespace vesprun {
namespace {

constexpr const char* kDateKey = "SSLastLoggedAt";

class NANDLogWriter : public testing::Test {
 protected:
  std::string log() const { return device.read("outbox/logs/0001-165-StorageStatus.log"); }
  /// The items of the log's last line.
  std::string items() const {
    const std::string text = log();
    const auto start = text.find("]: ");
    return start == std::string::npos ? "no log" : text.substr(start + 3);
  }

  TestDevice device{R"({"clock": "2024-03-05T09:15:02Z", "timeZone": "Asia/Kolkata",
    "system": {"systemID": "S1", "hardwareModel": "M2", "systemVersion": "V3", "incidentID": "I4"},
    "properties": {"InverseDeviceID": "F5"}})"};
};

TEST_F(NANDLogWriter, WritesNumbersAndArraysThatHoldANumber) {
  const PropertyDict fields{{"text", "7"},
                            {"float", 0.25F},
                            {"date", Date{}},
                            {"data", Bytes{1}},
                            {"dict", PropertyDict{{"a", 1}}},
                            {"empty", PropertyArray{}},
                            {"texts", PropertyArray{"", "a"}},
                            {"double", 2.5},
                            {"large", 1e20},
                            {"nan", -std::numeric_limits<double>::quiet_NaN()},
                            {"int", 7},
                            {"unsigned", std::uint64_t{18446744073709551615U}},
                            {"boolean", true},
                            {"mixed", PropertyArray{"", "a", 0.5, 3}}};
  NLW_WriteLog("165", nullptr);
  EXPECT_EQ(log(), "");
  NLW_WriteLog("165", &fields);
  EXPECT_EQ(items(),
            "float:0.25;double:2.50;large:100000000000000000000.00;nan:nan;int:7;"
            "unsigned:18446744073709551615;boolean:1;mixed:,a,0.5,3\n");
}

TEST_F(NANDLogWriter, WritesOnceInSevenDays) {
  const Date now = platform().clock().now();
  const std::pair<PropertyValue, bool> cases[] = {{Date{now.seconds - (6 * 24 + 23) * 3600}, false},
                                                  {Date{now.seconds - 604'800, 1}, false},
                                                  {Date{now.seconds - 604'800}, true},
                                                  {now, false},
                                                  {Date{now.seconds + 1'000'000'000}, false},
                                                  {"2024-03-05T09:15:02Z", true}};
  std::size_t logs = 0;
  const PropertyDict fields{{"text", "not written"}};
  for (const auto& [last, writes] : cases) {
    platform().preferences().LGSPreferencesSetValue(kDateKey, last, "vesprun");
    NLW_WriteLog("165", &fields);
    logs += writes ? 1U : 0U;
    EXPECT_EQ(device.names("outbox/logs").size(), logs);
    EXPECT_EQ(platform().preferences().LGSPreferencesGetValue(kDateKey, "vesprun"),
              writes ? now : last);
  }
  EXPECT_EQ(items(), "\n");
  EXPECT_THAT(device.log(),
              testing::Contains("default: NANDLogWriter:Last written at 2024-02-27 10:15:02 +0000 "
                                "current 2024-03-05 09:15:02 +0000 :skipped"));
}

TEST_F(NANDLogWriter, SaysThatMemoryRanOut) {
  const PropertyDict fields{{"long", PropertyArray(5000, 1)}};
  largestAllocation = 4000;
  NLW_WriteLog("165", &fields);
  largestAllocation = SIZE_MAX;
  EXPECT_THAT(device.log(), testing::ElementsAre("error: An exception occurred: std::bad_alloc"));
}

TEST(NANDLogSubmission, KeepsTheDateWhenItFails) {
  TestDevice device(R"({"clock": "2024-03-05T09:15:02Z", "submission": {"fails": true}})");
  const PropertyDict fields{{"n", 1}};
  NLW_WriteLog("165", &fields);
  EXPECT_FALSE(device.exists("outbox/logs"));
  EXPECT_EQ(platform().preferences().LGSPreferencesGetValue(kDateKey, "vesprun"),
            platform().clock().now());
  EXPECT_EQ(GetFaultlineKey(), "error");
}

TEST_F(NANDLogWriter, SortsTheValidityListByListNumber) {
  const Bytes list = bytesOf({5, 1,  0, 0, 9, 2,  10, 9, 9, 9, 0,  20,         9, 9, 9,
                              2, 30, 9, 9, 9, 16, 40, 9, 9, 9, 15, 0xFFFFFFFF, 9, 9});
  const auto handle = [](const Bytes& bytes, std::string& errors) {
    testing::internal::CaptureStderr();
    const bool result = WriteValidityListNANDLog(bytes, nullptr, "");
    errors = testing::internal::GetCapturedStderr();
    return result;
  };
  std::string errors;
  EXPECT_TRUE(handle({}, errors));  // not wanted
  gNeedValidityList = 1;
  gCurrentSysWamp = 1.25;
  gCurrentUserWamp = 2.5;
  std::vector<Bytes> refused{bytesOf({0, 0, 0, 0, 0, 0, 0}), bytesOf({0xFFFFFFFF, 0xFFFFFFFF, 0}),
                             bytesOf({0x33333334, 0x80000000, 0, 0, 0})};
  for (std::size_t length = 0; length < list.size(); ++length) {
    refused.emplace_back(list.begin(), list.begin() + static_cast<std::ptrdiff_t>(length));
  }
  for (const Bytes& bytes : refused) {
    EXPECT_FALSE(handle(bytes, errors)) << bytes.size();
    EXPECT_EQ(errors, "data cannot be parsed");
  }
  EXPECT_EQ(log(), "");
  EXPECT_EQ(platform().preferences().LGSPreferencesGetValue(kDateKey, "vesprun"), std::nullopt);
  EXPECT_TRUE(handle(list, errors));
  EXPECT_EQ(items(),
            "IntermediateWamp:1.25;UserWamp:2.50;ValidityList[0]:20;ValidityList[2]:10,30;"
            "ValidityList[15]:-1\n");
}

}  // namespace
}  // namespace vesprun
