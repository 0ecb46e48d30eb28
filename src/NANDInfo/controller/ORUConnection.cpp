#include "vesprun/ORUConnection.h"

#include <cstdio>

#include "NANDInfo/controller/EntryPoint.h"
#include "NANDInfo/controller/NandExporter.h"

namespace vesprun {
namespace {

bool open(ORUConnection& connection) {
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

}  // namespace

bool openORUConnection(ORUConnection& connection) noexcept {
  connection = {};
  const bool isOpen = runEntryPoint(__func__, [&] { return open(connection); });
  if (!isOpen) {
    closeORUConnection(connection);
  }
  return isOpen;
}

void closeORUConnection(ORUConnection& connection) noexcept {
  runEntryPoint(__func__, [&] { closeAndForget(connection.connection, connection.service); });
  connection.connection = 0;
  connection.service = 0;
}

}  // namespace vesprun
