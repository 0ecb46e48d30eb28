#include "NANDInfo/controller/ControllerListReader.h"

#include <array>
#include <cstdio>

#include "common/LittleEndian.h"

namespace vesprun {
namespace {

constexpr std::uint32_t kSizePhase = 1;
constexpr std::uint32_t kCallersFlag = 2;
constexpr unsigned kKindShift = 2;

}  // namespace

TunnelBuffer ControllerListReader::read(const TunnelSelector& selector, std::uint32_t kind,
                                        int index) const {
  const std::uint32_t flags = (_callersFlag ? kCallersFlag : 0) | kind << kKindShift;
  std::array<std::uint8_t, 4> size{};
  const RegistryResult result =
      call(_exporter.tunnelSizeMethod, selector.sizeOpcode, flags | kSizePhase, size);
  if (result != kRegistrySuccess) {
    std::fprintf(stderr,
                 "DevRegConnectCallStructMethod failed with status 0x%x on selector index %d\n",
                 result, index);
    return {};
  }
  return readData(selector.dataOpcode, flags, loadLittleEndian<std::uint32_t>(size.data()));
}

TunnelBuffer ControllerListReader::readData(std::uint32_t opcode, std::uint32_t flags,
                                            std::uint32_t size) const {
  if (size == 0) {
    return {};
  }
  // Not aligned to a page: the driver copies into it, and no handler can tell.
  TunnelBuffer buffer(size);
  if (!buffer) {
    std::fprintf(stderr, "Could not malloc %zu bytes", std::size_t{size});
    return {};
  }
  if (call(_exporter.tunnelDataMethod, opcode, flags, buffer.bytes()) != kRegistrySuccess) {
    std::fprintf(stderr, "Could not retrieve data from driver for selector %u\n", opcode);
    return {};
  }
  return buffer;
}

RegistryResult ControllerListReader::call(std::uint32_t method, std::uint32_t opcode,
                                          std::uint32_t flags,
                                          std::span<std::uint8_t> output) const {
  TunnelRequest request;
  request.opcode = opcode;
  request.sizeQuery = flags;
  std::uint64_t reportedLength = 0;
  return _registry.DevRegConnectCallStructMethod(_connection, method, request.encode(), output,
                                                 reportedLength);
}

}  // namespace vesprun
