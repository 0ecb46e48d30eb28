#include "NANDInfo/controller/Controller.h"

#include <array>
#include <cstdint>
#include <cstdio>
#include <utility>

#include "common/LittleEndian.h"

namespace vesprun {

bool Controller::open(const char* complainer) {
  if (!_service) {
    std::fprintf(stderr, "%sCould not get matching DevRegKit service for exporting classes\n",
                 complainer);
    return false;
  }
  if (platform().deviceRegistry().DevRegServiceOpen(_service.get(), _connection) !=
      kRegistrySuccess) {
    std::fputs("Could not get connection to service\n", stderr);
    return false;
  }
  return true;
}

bool Controller::close() {
  const RegistryHandle handle = std::exchange(_connection, 0);
  if (handle == 0 || platform().deviceRegistry().DevRegServiceClose(handle) == kRegistrySuccess) {
    return true;
  }
  std::fputs("Could not close connection to service\n", stderr);
  return false;
}

bool Controller::recommendsContentDeletion() {
  const std::uint32_t method = exporter().contentDeletionMethod;
  if (method == kMethodNotOffered || !open("_load_nand_info")) {
    return false;
  }
  std::array<std::uint8_t, 4> answer{};
  std::uint64_t length = 0;
  return platform().deviceRegistry().DevRegConnectCallStructMethod(connection(), method, {}, answer,
                                                                   length) == kRegistrySuccess &&
         length >= answer.size() && loadLittleEndian<std::uint32_t>(answer.data()) != 0;
}

bool openConnection(ORUConnection& connection) {
  connection.service = findNandExporter(connection.exporter);
  if (connection.service == 0) {
    std::fputs("Can't get ORU Connection, no matching service!\n", stderr);
    return false;
  }
  nand_exporter_t& exporter = *connection.exporter;
  const RegistryResult result =
      platform().deviceRegistry().DevRegServiceOpen(connection.service, connection.connection);
  exporter.connection = connection.connection;
  if (result != kRegistrySuccess) {
    std::fprintf(stderr, "DevRegServiceOpen failed for class '%s', result 0x%x\n", exporter.name,
                 result);
  }
  if (exporter.getStatsSelectors == nullptr || connection.connection == 0) {
    std::fputs("Can't get ORU Connection!\n", stderr);
    return false;
  }
  return true;
}

}  // namespace vesprun
