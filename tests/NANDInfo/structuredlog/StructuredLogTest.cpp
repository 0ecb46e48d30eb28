#include "NANDInfo/structuredlog/StructuredLog.h"

#include "NANDInfo/controller/NandExporter.h"
#include "NANDInfo/structuredlog/StructuredLogGlobals.h"
#include "buffers/DeviceBuffers.h"
#include "common/TextForm.h"
#include "support/ControllerTest.h"
#include "support/WatchedRegistry.h"

namespace vesprun {
namespace {

class StructuredLog : public ControllerTest {
 protected:
  /// A controller that delivers every list, with a write amplification of 1.25. Of several answers
  /// to a request the first counts: `tunnel` comes before its own. Its characteristics are its
  /// parent's, unless it has some; those of its sibling and its child are no concern of its.
  void startWithLists(const std::string& tunnel = "", const std::string& properties = "{}") {
    const std::string unusable = R"("properties": {"Controller Characteristics": 5}})";
    start(R"({"class": "Bus", "properties": {"Controller Characteristics":
                  {"chip-id": "KX3", "manufacturer-id": "", "num-bus": 1}}, "children": [
              {"class": "Sibling", )" +
          unusable + R"(, {"class": "QuillQNS3NVMeController", "properties": )" + properties +
          R"(, "children": [{"class": "Child", )" + unusable + R"(], "userClient": {"tunnel": [)" +
          tunnel + (tunnel.empty() ? "" : ",") +
          R"({"opcode": 13, "file": "13.bin"}, {"opcode": 11, "file": "11.bin"},
             {"opcode": 17, "kind": 0, "file": "17.bin"}, {"opcode": 17, "kind": 1, "file": "17.bin"},
             {"opcode": 17, "kind": 2, "file": "17.bin"}, {"opcode": 15, "file": "15.bin"}]}}]})");
    StatisticsBufferBuilder statistics;
    statistics.add(20, {100}).add(50, {256}).add(49, {16384}).add(4, {81920});
    device().write("13.bin", statistics.add(129, {128}).add(84, {80}).bytes());
    device().write("11.bin", bytesOf({1, 0, 0, 3, 7, 0, 0}));
    device().write("17.bin", telemetryList(1));
    device().write("15.bin", bytesOf({0, 9, 1, 0, 0, 0, 0, 5, 0, 0, 1}));
  }

  /// The result ("true" or "false"), the number of records so far, and the errors.
  std::string dump(bool callersFlag = false) {
    bool result = false;
    const std::string errors = errorsOf([&] { result = DumpStorageStructuredLog(callersFlag); });
    return (result ? "true " : "false ") + std::to_string(device().lines("records.jsonl").size()) +
           ' ' + errors;
  }
};

TEST_F(StructuredLog, WritesTheValidityListOnlyWhenItIsWanted) {
  startWithLists();
  EXPECT_EQ(dump(), "true 5 ");
  EXPECT_EQ(gNeedValidityList, 0);
  EXPECT_EQ(gCurrentUserWamp, 1.25);
  EXPECT_EQ(gCurrentSysWamp, 0.5);
  EXPECT_FALSE(device().exists("outbox/logs"));
  const auto lines = device().lines("records.jsonl");
  EXPECT_EQ(textForm(*lines.at(3).find("record")), "{Factory Count = 9}");
  EXPECT_EQ(textForm(*lines.at(4).find("record")->dict()->find("Reason")), "205");

  platform().preferences().LGSPreferencesSetValue("userWAmp", 1.2, "com.quill.NANDInfo");
  EXPECT_EQ(dump(), "true 10 ");
  const std::string log = device().read("outbox/logs/0001-165-StorageStatus.log");
  EXPECT_THAT(log,
              testing::HasSubstr("]: IntermediateWamp:0.50;UserWamp:1.25;com.quill.NANDInfo."));
  EXPECT_THAT(log, testing::EndsWith(";ValidityList[3]:7\n"));

  startWithLists(R"({"opcode": 11, "size": 28}, {"opcode": 13, "sizeError": 1})");
  gForceCollectionSet = 1;
  EXPECT_EQ(dump(), "false 5 data cannot be parsed");
  EXPECT_EQ(gCurrentUserWamp, 0.0);
}

TEST_F(StructuredLog, FindsTheCharacteristicsUnderTheNameThatTheClassHas) {
  const std::pair<std::string, std::string> names[] = {
      {"QuillEmbeddedNVMeController", "Controller Characteristics"},
      {"ORUStorage", "DevRegPropertyMatch"}};
  for (const auto& [className, property] : names) {
    start(
        R"({"class": ")" + className + R"(", "properties": {")" + property +
        R"(": {"nand-device-desc": 7}}, "userClient": {"tunnel": [{"opcode": 15, "size": 12}]}})");
    dump();
    EXPECT_EQ(textForm(*device().lines("records.jsonl").at(0).find("record")),
              "{Factory Count = 0; com.quill.NANDInfo.nandDesc = 7}");
  }
}

TEST_F(StructuredLog, SendsKindsAndTheCallersFlag) {
  startWithLists();
  for (const std::uint32_t flag : {0U, 2U}) {
    WatchedRegistry registry(device().platform());
    dump(flag != 0);
    std::vector<Bytes> requests;
    for (const WatchedRegistry::Call& call : registry.calls()) {
      if (call.operation == "struct") {
        EXPECT_EQ(call.method, 9U);
        requests.push_back(call.input);
      }
    }
    std::vector<Bytes> expected(requests.begin(), requests.begin() + 2);  // for the statistics
    const std::pair<std::uint32_t, std::uint32_t> lists[] = {
        {11, 0}, {17, 0}, {17, 4}, {17, 8}, {15, 0}};
    for (const auto& [opcode, kind] : lists) {
      expected.push_back(bytesOf({opcode, kind | flag | 1, 0, 0, 0, 0}));
      expected.push_back(bytesOf({opcode, kind | flag, 0, 0, 0, 0}));
    }
    EXPECT_EQ(requests, expected);
  }
}

TEST_F(StructuredLog, TakesTheStatedSizeForTheLength) {
  const std::pair<std::string, std::string> cases[] = {
      {R"({"opcode": 17, "kind": 1, "size": 0, "dataError": 5})", "true 4 "},
      {R"({"opcode": 17, "kind": 0, "file": "17.bin", "size": 4129, "length": 3})", "true 5 "},
      {R"({"opcode": 17, "kind": 0, "size": 4128})", "true 5 "},
      {R"({"opcode": 17, "kind": 0, "size": 4127, "length": 4128})",
       "false 4 ERROR: Attempting to parse beyond the bounds of the buffer\n"}};
  for (const auto& [tunnel, outcome] : cases) {
    startWithLists(tunnel);
    EXPECT_EQ(dump(), outcome) << tunnel;
  }
}

TEST_F(StructuredLog, GivesEverythingBackWhicheverCallFails) {
  const std::string size =
      "DevRegConnectCallStructMethod failed with status 0xe00002d8 on selector index ";
  const std::string data = "Could not retrieve data from driver for selector ";
  const std::string outcomes[] = {
      // Looking for the controller, opening it, two calls for its statistics, closing it.
      "true 5 " + kNoMatch, "true 5 Could not get connection to service\n", "true 5 ", "true 5 ",
      "true 5 Could not close connection to service\n",
      // Looking for it again, opening it, searching its properties.
      "true 5 " + kNoMatch, "false 0 Could not get connection to service\n",
      "false 0 failed to create dictionary",
      // Two calls for each list, closing.
      "true 5 " + size + "0\n", "true 5 " + data + "11\n", "true 4 " + size + "1\n",
      "true 4 " + data + "17\n", "true 4 " + size + "2\n", "true 4 " + data + "17\n",
      "true 4 " + size + "3\n", "true 4 " + data + "17\n", "true 3 " + size + "4\n",
      "true 3 " + data + "15\n", "true 5 Could not close connection to service\n"};
  std::size_t number = 0;
  for (const std::string& outcome : outcomes) {
    startWithLists();
    WatchedRegistry registry(device().platform());
    registry.failCall(++number);
    EXPECT_EQ(dump(), outcome) << number;
    EXPECT_GE(registry.calls().size(), number);
  }
}

TEST_F(StructuredLog, FetchesOnlyWhatTheControllerOffers) {
  startWithLists("", R"({"Controller Characteristics": 5})");
  const std::string unusable = "ERROR: Could not parse the Device Characteristics dictionary\n";
  EXPECT_EQ(dump(), "false 2 " + unusable + unusable + unusable);

  startWithLists();
  nand_exporter_t& exporter = nand_exporters_tunnel[0];
  const nand_exporter_t complete = exporter;
  exporter.getTelemetryListSelectors = [] { return static_cast<const TunnelSelector*>(nullptr); };
  EXPECT_EQ(dump(), "false 2 ");
  exporter.getBandStatsSelectors = nullptr;
  exporter.getTelemetryListSelectors = nullptr;
  exporter.getDefectsListSelectors = nullptr;
  EXPECT_EQ(dump(),
            "true 2 Validity list retrieval is not supported\n"
            "Telemetry list retrieval is not supported\n"
            "Defects list retrieval is not supported\n");
  exporter = complete;
}

}  // namespace
}  // namespace vesprun
