#include "NANDInfo/ContentDeletion.h"

#include <array>
#include <cstdint>
#include <cstdio>

#include "NANDInfo/controller/ControllerConnection.h"
#include "NANDInfo/controller/EntryPoint.h"
#include "NANDInfo/controller/NandExporter.h"
#include "common/LittleEndian.h"
#include "platform/RegistryObject.h"

namespace vesprun {

bool NandRecommendsContentDeletion() noexcept {
  return runEntryPoint(__func__, [&] {
    nand_exporter_t* exporter = nullptr;
    const RegistryObject service(findNandExporter(exporter));
    if (exporter->contentDeletionMethod == kMethodNotOffered) {
      return false;
    }
    if (!service) {
      std::fputs("_load_nand_infoCould not get matching DevRegKit service for exporting classes\n",
                 stderr);
      return false;
    }
    const ControllerConnection connection(service.get());
    if (!connection) {
      std::fputs("Could not get connection to service\n", stderr);
      return false;
    }
    std::array<std::uint8_t, 4> answer{};
    std::uint64_t length = 0;
    return platform().deviceRegistry().DevRegConnectCallStructMethod(
               connection.get(), exporter->contentDeletionMethod, {}, answer, length) ==
               kRegistrySuccess &&
           length >= answer.size() && loadLittleEndian<std::uint32_t>(answer.data()) != 0;
  });
}

}  // namespace vesprun
