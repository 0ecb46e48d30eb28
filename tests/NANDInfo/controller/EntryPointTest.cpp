#include "NANDInfo/controller/EntryPoint.h"
#include "common/ProcessState.h"

#include "buffers/DeviceBuffers.h"
#include "platform/host/registry/HostDeviceRegistry.h"
#include "support/ControllerTest.h"
#include "support/ScarceMemory.h"
#include "vesprun.hpp"

namespace vesprun {
namespace {

bool isEmpty(const PropertyDict& result) { return result.empty(); }
bool isEmpty(const std::optional<PropertyDict>& result) { return !result; }

struct EntryPoint {
  const char* name;
  bool (*answersNothing)();
};

constexpr EntryPoint kEntryPoints[] = {
    {"CopyNANDInfo", [] { return isEmpty(CopyNANDInfo()); }},
    {"CopyNANDInfoWithOptions", [] { return isEmpty(CopyNANDInfoWithOptions({})); }},
    {"DumpNANDInfo",
     [] {
       PropertyDict info;
       DumpNANDInfo(info);
       return isEmpty(info);
     }},
    {"CopyNANDFTLInfo", [] { return isEmpty(CopyNANDFTLInfo(false, 1)); }},
    {"CopyWhitelistedNANDFTLInfo", [] { return isEmpty(CopyWhitelistedNANDFTLInfo(true)); }},
    {"CopyWhitelistedNANDMSPInfo", [] { return isEmpty(CopyWhitelistedNANDMSPInfo(true)); }},
    {"CopyWhitelistedStorageStats", [] { return isEmpty(CopyWhitelistedStorageStats(true)); }},
    {"CopyTendmarkNANDInfo", [] { return isEmpty(CopyTendmarkNANDInfo()); }},
    {"CopyOTANANDInfo", [] { return isEmpty(CopyOTANANDInfo()); }},
    {"CopyInternalLabNANDInfo", [] { return isEmpty(CopyInternalLabNANDInfo()); }},
    {"CopySMagNANDFTLInfo", [] { return isEmpty(CopySMagNANDFTLInfo(24, 1, 2)); }},
    {"CopySMagNANDFTLCustomHistoryInfo",
     [] { return isEmpty(CopySMagNANDFTLCustomHistoryInfo(0)); }},
    {"CopyVMFreezerNANDInfo", [] { return isEmpty(CopyVMFreezerNANDInfo()); }},
    {"NandRecommendsContentDeletion", [] { return !NandRecommendsContentDeletion(); }},
    {"NandInfoExtractToEH_runAllSteps",
     [] { return isEmpty(NandInfoExtractToEH_runAllSteps(0, true, 1, 0)); }},
    {"openORUConnection", [] {
       ORUConnection connection;
       const bool opened = openORUConnection(connection);
       closeORUConnection(connection);
       return !opened && connection.connection == 0 && connection.service == 0;
     }}};

class EntryPointTest : public ControllerTest {};

TEST_F(EntryPointTest, AnswersNothingWithoutADevice) {
  EXPECT_EQ(GetAPIErrorMessage(), "NA");
  for (const EntryPoint& entry : kEntryPoints) {
    ProcessState::startAfresh();
    EXPECT_TRUE(entry.answersNothing()) << entry.name;
    EXPECT_EQ(GetAPIErrorMessage(), std::string(entry.name) + ": no device is open");
  }
}

TEST_F(EntryPointTest, RunsOutOfMemoryWithoutThrowingOrHoldingAnything) {
  TestDevice device(
      R"({"logLevel": "error", "events": {"used": []},
                        "kernel": {"snapshot": "snapshot"}, "registry": [)" +
      controller("QuillQNS3NVMeController", R"({"opcode": 13, "file": "ftl"},
                        {"opcode": 10, "argument": 0, "file": "ftl"},
                        {"opcode": 10, "argument": 4, "file": "ftl"},
                        {"opcode": 10, "argument": 24, "file": "ftl"},
                        {"opcode": 221, "argument": 0, "file": "msp"})") +
      R"(, {"class": "QuillNVMeEAN", "userClient": {"scalarMethods": {"3": {"dBIC": 1}}}}]})");
  device.write("ftl", StatisticsBufferBuilder().add(4, {9000}).add(680, {1, 2, 3}).bytes());
  device.write("msp", MSPBufferBuilder().add(8202, {40}).bytes());
  device.write("snapshot", SnapshotBuilder().thread(1, "VM_swapout", 7).bytes);
  const HostDeviceRegistry& registry = device.platform().describedRegistry();
  for (const EntryPoint& entry : kEntryPoints) {
    const bool answersNothing = entry.answersNothing();
    std::size_t failing = 0;
    bool hasFailed = true;
    while (hasFailed) {
      failing += 1 + failing / 16;
      errorsOf([&] {
        allocationsLeft = failing;
        entry.answersNothing();
        hasFailed = std::exchange(allocationsLeft, 0) == 0;
      });
      ASSERT_EQ(registry.openObjects(), 0U) << entry.name << ' ' << failing;
      ASSERT_EQ(registry.openConnections(), 0U) << entry.name << ' ' << failing;
    }
    EXPECT_GT(failing, 1U) << entry.name;
    EXPECT_EQ(entry.answersNothing(), answersNothing) << entry.name;
  }
}

TEST_F(EntryPointTest, RecordsWhatMemoryRanOutIn) {
  start("");
  allocationsLeft = 1;
  const bool isNothing = !CopyNANDInfoWithOptions({});
  allocationsLeft = 0;
  EXPECT_TRUE(isNothing);
  EXPECT_EQ(GetAPIErrorMessage(), "CopyNANDInfoWithOptions: std::bad_alloc");
}

}  // namespace
}  // namespace vesprun
