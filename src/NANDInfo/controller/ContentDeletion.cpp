#include "vesprun/ContentDeletion.h"

#include <array>
#include <cstdint>

#include "NANDInfo/controller/Controller.h"
#include "NANDInfo/controller/EntryPoint.h"
#include "common/LittleEndian.h"

namespace vesprun {

bool NandRecommendsContentDeletion() noexcept {
  return runEntryPoint(__func__, [] {
    Controller controller;
    const std::uint32_t method = controller.exporter().contentDeletionMethod;
    if (method == kMethodNotOffered || !controller.open("_load_nand_info")) {
      return false;
    }
    std::array<std::uint8_t, 4> answer{};
    std::uint64_t length = 0;
    return platform().deviceRegistry().DevRegConnectCallStructMethod(
               controller.connection(), method, {}, answer, length) == kRegistrySuccess &&
           length >= answer.size() && loadLittleEndian<std::uint32_t>(answer.data()) != 0;
  });
}

}  // namespace vesprun
