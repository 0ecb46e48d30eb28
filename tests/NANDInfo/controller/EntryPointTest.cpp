#include "buffers/DeviceBuffers.h"
#include "common/ProcessState.h"
#include "interface/EntryPoints.h"
#include "platform/host/registry/HostDeviceRegistry.h"
#include "support/ControllerTest.h"
#include "support/ScarceMemory.h"
#include "vesprun/vesprun.hpp"

namespace vesprun {
namespace {

/// Those that keep an error text of their own.
std::vector<EntryPointRow> guardedEntryPoints() {
  std::vector<EntryPointRow> rows(entryPoints().begin(), entryPoints().end());
  std::erase_if(rows, [](const EntryPointRow& row) {
    const std::string_view name = row.command;
    return name == "structured-log" || name == "disk" || name == "nvram";
  });
  return rows;
}

bool answersNothing(const EntryPointRow& row) {
  std::vector<std::uint64_t> values;
  for (const EntryPointParameter& parameter : row.parameters) {
    values.push_back(parameter.isNeeded ? 24 : parameter.absent);
  }
  const std::optional<PropertyValue> result = row.call(values);
  return !result || result == PropertyValue(PropertyDict()) || result == PropertyValue(false);
}

class EntryPointTest : public ControllerTest {};

TEST_F(EntryPointTest, AnswersNothingWithoutADevice) {
  EXPECT_EQ(GetAPIErrorMessage(), "NA");
  for (const EntryPointRow& entry : guardedEntryPoints()) {
    ProcessState::startAfresh();
    EXPECT_TRUE(answersNothing(entry)) << entry.function;
    EXPECT_EQ(GetAPIErrorMessage(), std::string(entry.function) + ": no device is open");
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
  for (const EntryPointRow& entry : guardedEntryPoints()) {
    const bool isNothing = answersNothing(entry);
    std::size_t failing = 0;
    bool hasFailed = true;
    while (hasFailed) {
      failing += 1 + failing / 16;
      errorsOf([&] {
        allocationsLeft = failing;
        try {
          answersNothing(entry);
        } catch (const std::bad_alloc&) {
          // Of the table's row: an entry point that throws ends the process.
        }
        hasFailed = std::exchange(allocationsLeft, 0) == 0;
      });
      ASSERT_EQ(registry.openObjects(), 0U) << entry.function << ' ' << failing;
      ASSERT_EQ(registry.openConnections(), 0U) << entry.function << ' ' << failing;
    }
    EXPECT_GT(failing, 1U) << entry.function;
    EXPECT_EQ(answersNothing(entry), isNothing) << entry.function;
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
