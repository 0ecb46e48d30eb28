#include "NANDInfo/controller/TunnelCommand.h"

#include <algorithm>

#include "NANDInfo/parsers/ErrorMessages.h"
#include "common/LittleEndian.h"
#include "platform/Platform.h"

namespace vesprun {

// calloc gets large blocks zeroed from the system, without touching them.
TunnelBuffer::TunnelBuffer(std::size_t size)
    : _bytes(static_cast<std::uint8_t*>(std::calloc(std::max<std::size_t>(size, 1), 1))),
      _size(size) {}

std::span<const std::uint8_t> TunnelBuffer::bytes(std::uint64_t length) const {
  return {_bytes.get(), static_cast<std::size_t>(std::min<std::uint64_t>(length, size()))};
}

bool executeTunnelCommand(RegistryHandle connection, const nand_exporter_t& exporter,
                          const TunnelSelector* selector, TunnelRequest& request,
                          TunnelBuffer& buffer, std::uint64_t& length) {
  request.inputLength = 0;
  request.inputAddress = 0;
  if (connection == 0) {
    SetAPIErrorMessage("executeTunnelCommand: Invalid connection");
    return false;
  }
  if (exporter.tunnelSizeMethod == 0 || exporter.tunnelDataMethod == 0) {
    SetAPIErrorMessage("executeTunnelCommand: Invalid exporter");
    return false;
  }
  if (selector == nullptr) {
    SetAPIErrorMessage("executeTunnelCommand: Invalid opType Selector");
    return false;
  }

  DeviceRegistry& registry = platform().deviceRegistry();
  request.inputLength = static_cast<std::uint32_t>(length);
  request.inputAddress = reinterpret_cast<std::uintptr_t>(&buffer);
  request.opcode = selector->sizeOpcode;
  request.sizeQuery = 1;
  std::array<std::uint8_t, 4> answer{};
  std::uint64_t reported = 0;
  if (registry.DevRegConnectCallStructMethod(connection, exporter.tunnelSizeMethod,
                                             request.encode(), answer,
                                             reported) != kRegistrySuccess) {
    SetAPIErrorMessage(
        "executeTunnelCommand: DevRegConnectCallStructMethod failed while retrieving data size");
    buffer = TunnelBuffer();
    length = 0;
    return false;
  }
  const auto size = loadLittleEndian<std::uint32_t>(answer.data());

  TunnelBuffer block(size);
  if (!block) {
    SetAPIErrorMessage("executeTunnelCommand: Could not allocate buffer");
    return false;
  }
  request.opcode = selector->dataOpcode;
  request.sizeQuery = 0;
  reported = 0;
  if (registry.DevRegConnectCallStructMethod(connection, exporter.tunnelDataMethod,
                                             request.encode(), block.bytes(),
                                             reported) != kRegistrySuccess) {
    SetAPIErrorMessage(
        "executeTunnelCommand: DevRegConnectCallStructMethod failed while retrieving data");
    return false;
  }
  buffer = std::move(block);
  length = std::min<std::uint64_t>(reported, size);
  return true;
}

}  // namespace vesprun
