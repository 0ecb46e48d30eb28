#include "NANDInfo/controller/NandExporter.h"

#include "platform/host/registry/HostDeviceRegistry.h"
#include "support/ControllerTest.h"
#include "support/WatchedRegistry.h"
#include "vesprun/ORUConnection.h"

namespace vesprun {
namespace {

using testing::ElementsAre;

const std::string kFirst = "QuillQNS3NVMeController";
const std::string kSecond = "QuillEmbeddedNVMeController";
const std::string kThird = "ORUStorage";
const std::string kRefusing = R"(, "openError": 3758097084)";

std::string hidden(const std::string& entry) {
  return R"({"class": "Bus", "children": [{"matching": false, )" + entry.substr(1) + "]}";
}

nand_exporter_t& endOfTable() { return nand_exporters_tunnel.back(); }

class NandExporterTest : public ControllerTest {};

TEST_F(NandExporterTest, LookUpGoesByTableThenByIterator) {
  const std::string found = "notice: NANDInfo: findNandExporter: Controller found: ";
  const std::string walked = "notice: Find service for class ";
  const std::tuple<std::string, std::size_t, std::string, bool> cases[] = {
      {controller(kThird), 2, found + kThird, false},
      {controller(kThird) + ',' + controller(kSecond), 1, found + kSecond, false},
      {R"({"class": "Own", "conformsTo": ["ORUStorage"]})", 2, found + kThird, false},
      {hidden(controller(kFirst)) + ',' + controller(kThird), 2, found + kThird, false},
      {hidden(controller(kThird)) + ',' + hidden(controller(kSecond)), 1, walked + kSecond, true},
      {R"({"class": "Other"})", 3, "", true},
  };
  for (const auto& [registry, entry, line, walks] : cases) {
    HostPlatform& platform = start(registry);
    nand_exporter_t* exporter = nullptr;
    RegistryHandle service = 0;
    EXPECT_EQ(errorsOf([&] { service = findNandExporter(exporter); }), walks ? kNoMatch : "");
    EXPECT_EQ(exporter, &nand_exporters_tunnel[entry]) << registry;
    EXPECT_EQ(service != 0, entry < 3);
    EXPECT_EQ(device().log(), line.empty() ? std::vector<std::string>() : std::vector{line + '\n'});
    EXPECT_EQ(platform.describedRegistry().openObjects(), service != 0 ? 1u : 0u);
    platform.deviceRegistry().DevRegObjectRelease(service);
  }
}

TEST_F(NandExporterTest, OpeningSkipsAControllerThatRefuses) {
  WatchedRegistry watched(start(controller(kFirst, "", kRefusing) + ',' + controller(kThird)));
  nand_exporter_t* exporter = nullptr;
  ASSERT_TRUE(findNandExporterNew(exporter));
  EXPECT_EQ(exporter, &nand_exporters_tunnel[2]);
  EXPECT_THAT(watched.operations(), ElementsAre("match " + kFirst, "open", "close",
                                                "match " + kSecond, "match " + kThird, "open"));
  EXPECT_EQ(watched.calls()[2].handle, 0u);  // what the refused open gave
  EXPECT_EQ(
      device().log(),
      std::vector{"notice: NANDInfo: findNandExporterNew: Controller found: " + kThird + '\n'});
  EXPECT_NE(exporter->connection, 0u);
  EXPECT_NE(exporter->service, 0u);
  ReleaseIOInterfaces(*exporter);
  EXPECT_EQ(exporter->connection, 0u);
  EXPECT_EQ(exporter->service, 0u);
}

TEST_F(NandExporterTest, OpeningNothingPointsAtTheEndOfTheTable) {
  for (const std::string& registry :
       {std::string(), hidden(controller(kFirst)), controller(kSecond, "", kRefusing)}) {
    start(registry);
    endOfTable().connection = 7;
    endOfTable().service = 8;
    nand_exporter_t* exporter = nullptr;
    EXPECT_FALSE(findNandExporterNew(exporter));
    EXPECT_EQ(exporter, &endOfTable());
    EXPECT_EQ(exporter->connection, 0u);
    EXPECT_EQ(exporter->service, 0u);
  }
}

TEST_F(NandExporterTest, ConnectionForOtherPrograms) {
  HostPlatform& platform = start(controller(kSecond));
  ORUConnection connection;
  connection.connection = 99;
  EXPECT_TRUE(openORUConnection(connection));
  EXPECT_EQ(connection.exporter, &nand_exporters_tunnel[1]);
  EXPECT_EQ(connection.exporter->connection, connection.connection);
  EXPECT_EQ(platform.describedRegistry().openConnections(), 1u);
  closeORUConnection(connection);
  EXPECT_EQ(connection.connection, 0u);
  EXPECT_EQ(connection.service, 0u);
  closeORUConnection(connection);
  expectNothingHeld();

  const auto getter = std::exchange(nand_exporters_tunnel[1].getStatsSelectors, nullptr);
  EXPECT_EQ(errorsOf([&] { EXPECT_FALSE(openORUConnection(connection)); }),
            "Can't get ORU Connection!\n");
  nand_exporters_tunnel[1].getStatsSelectors = getter;

  start("");
  connection.connection = 99;  // of somebody else
  EXPECT_EQ(errorsOf([&] { EXPECT_FALSE(openORUConnection(connection)); }),
            kNoMatch + "Can't get ORU Connection, no matching service!\n");
  EXPECT_EQ(connection.exporter, &endOfTable());

  start(controller(kThird, "", kRefusing));
  EXPECT_EQ(errorsOf([&] { EXPECT_FALSE(openORUConnection(connection)); }),
            "DevRegServiceOpen failed for class 'ORUStorage', result 0xe00002bc\n"
            "Can't get ORU Connection!\n");
  EXPECT_EQ(connection.service, 0u);
}

}  // namespace
}  // namespace vesprun
