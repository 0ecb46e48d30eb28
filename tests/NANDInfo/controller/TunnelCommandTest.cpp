#include "NANDInfo/controller/TunnelCommand.h"

#include "NANDInfo/parsers/ErrorMessages.h"
#include "common/ProcessState.h"
#include "support/ControllerTest.h"
#include "support/WatchedRegistry.h"

namespace vesprun {
namespace {

const std::string kDataFailed =
    "executeTunnelCommand: DevRegConnectCallStructMethod failed while retrieving data";

class TunnelCommandTest : public ControllerTest {
 protected:
  /// Opens the controller, runs `command` on it, and closes it.
  void onController(const std::function<void(nand_exporter_t&)>& command) {
    nand_exporter_t* exporter = nullptr;
    ASSERT_TRUE(findNandExporterNew(exporter));
    command(*exporter);
    ReleaseIOInterfaces(*exporter);
  }
};

TEST_F(TunnelCommandTest, RequestIsExactToTheByte) {
  WatchedRegistry watched(start(
      controller("ORUStorage", R"({"opcode": 10, "argument": 168, "file": "statistics.bin"})")));
  onController([&](const nand_exporter_t& exporter) {
    TunnelRequest request{99, 99, 168, 99, 99};
    TunnelBuffer buffer;
    std::uint64_t length = 0x1'0000'0007;
    ASSERT_TRUE(executeTunnelCommand(exporter.connection, exporter, &readStatsSelector, request,
                                     buffer, length));
    const std::string content = device().read("statistics.bin");
    EXPECT_EQ(length, content.size());
    EXPECT_EQ(std::string(buffer.bytes().begin(), buffer.bytes().end()), content);

    const auto address = std::bit_cast<std::array<std::uint8_t, 8>>(&buffer);
    std::size_t calls = 0;
    for (const WatchedRegistry::Call& call : watched.calls()) {
      if (call.operation == "struct") {
        Bytes expected{10, 0, 0, 0, 0, 0, 0, 0, 168, 0, 0, 0, 7, 0, 0, 0};
        expected[4] = calls++ == 0 ? 1 : 0;
        expected.insert(expected.end(), address.begin(), address.end());
        EXPECT_EQ(call.method, 8u);
        EXPECT_EQ(call.input, expected);
      }
    }
    EXPECT_EQ(calls, 2u);
  });
}

TEST_F(TunnelCommandTest, NothingIsSentWithoutConnectionMethodOrSelector) {
  WatchedRegistry watched(start(controller("ORUStorage", kStatisticsAnswer)));
  nand_exporter_t exporter = nand_exporters_tunnel[2];
  struct Case {
    RegistryHandle connection;
    std::uint32_t sizeMethod;
    std::uint32_t dataMethod;
    const TunnelSelector* selector;
    std::string error;
  };
  const Case cases[] = {{0, 0, 8, nullptr, "executeTunnelCommand: Invalid connection"},
                        {1, 0, 8, nullptr, "executeTunnelCommand: Invalid exporter"},
                        {1, 8, 0, nullptr, "executeTunnelCommand: Invalid exporter"},
                        {1, 8, 8, nullptr, "executeTunnelCommand: Invalid opType Selector"}};
  for (const Case& call : cases) {
    ProcessState::startAfresh();
    exporter.tunnelSizeMethod = call.sizeMethod;
    exporter.tunnelDataMethod = call.dataMethod;
    TunnelRequest request{1, 2, 3, 4, 5};
    TunnelBuffer buffer;
    std::uint64_t length = 6;
    EXPECT_FALSE(
        executeTunnelCommand(call.connection, exporter, call.selector, request, buffer, length));
    EXPECT_EQ(GetAPIErrorMessage(), call.error);
    EXPECT_EQ(request.encode(), (TunnelRequest{1, 2, 3, 0, 0}.encode()));
    EXPECT_EQ(length, 6u);
  }
  EXPECT_TRUE(watched.calls().empty());
}

TEST_F(TunnelCommandTest, AnswersOfEveryShape) {
  struct Case {
    std::string answer;
    std::string error;     ///< "NA": it succeeds
    std::size_t size = 0;  ///< of the block
    std::uint64_t length = 0;
  };
  const std::string file = R"({"opcode": 13, "file": "statistics.bin")";
  const Case cases[] = {
      {file + "}", "NA", 48, 48},
      {file + R"(, "length": 20})", "NA", 48, 20},
      {file + R"(, "length": 4294967300})", "NA", 48, 48},  // never more than there is
      {file + R"(, "size": 8})", "NA", 8, 8},
      {file + R"(, "size": 20000000})", "NA", 20000000, 48},
      {file + R"(, "size": 0})", "NA", 0, 0},
      {R"({"opcode": 13, "size": 16, "length": 16})", "NA", 16, 16},
      {file + R"(, "sizeError": 1})", kSizeFailed},
      {file + R"(, "dataError": 1})", kDataFailed, 3, 5},
      {R"({"opcode": 14, "file": "statistics.bin"})", kSizeFailed},
      {R"({"opcode": 13, "argument": 1, "file": "statistics.bin"})", kSizeFailed},
      {R"({"opcode": 13, "kind": 1, "file": "statistics.bin"})", kSizeFailed},
      {R"({"opcode": 13, "file": "missing.bin"})", kSizeFailed}};
  for (const Case& given : cases) {
    start(controller("QuillEmbeddedNVMeController", given.answer));
    onController([&](const nand_exporter_t& exporter) {
      TunnelRequest request;
      TunnelBuffer buffer(3);
      std::uint64_t length = 5;
      EXPECT_EQ(executeTunnelCommand(exporter.connection, exporter, &statsSelector, request, buffer,
                                     length),
                given.error == "NA");
      EXPECT_EQ(GetAPIErrorMessage(), given.error) << given.answer;
      EXPECT_EQ(buffer.size(), given.size) << given.answer;
      EXPECT_EQ(length, given.length) << given.answer;
    });
  }
  EXPECT_THAT(device().log().back(), testing::HasSubstr("missing.bin"));
}

}  // namespace
}  // namespace vesprun
