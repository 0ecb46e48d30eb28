#pragma once

#include <cstdint>
#include <optional>
#include <span>
#include <string>

#include "vesprun/PropertyValue.h"

namespace vesprun {

/// Nanoseconds per tick as a fraction.
struct TickRatio {
  std::uint32_t numerator;
  std::uint32_t denominator;
};

/// The kernel's own figures.
class Kernel {
 public:
  virtual ~Kernel() = default;

  /// Reads a variable into `buffer`. 0, and the bytes written in `length`; or a system error
  /// number, and `buffer` untouched. The variable must have the buffer's size; text, with its final
  /// NUL, may be shorter.
  ///
  /// "kern.next_ecc_event" (72 bytes) is a queue: each read takes one event; error 2 when it is
  /// empty. An event that is not acknowledged comes back with the next process.
  virtual int sysctlbyname(const std::string& name, std::span<std::uint8_t> buffer,
                           std::size_t& length) = 0;

  /// Removes the ECC event that was read last. False when it will be read again.
  virtual bool acknowledgeECCEvent() = 0;

  /// Bytes of a memory page.
  virtual std::uint64_t pageSize() = 0;

  /// Rises while the system is awake.
  virtual std::uint64_t monotonicTicks() = 0;

  /// Nothing when it is unknown.
  virtual std::optional<TickRatio> tickRatio() = 0;

  /// A snapshot of the kernel as a row of typed items, with the content that `captureFlags` asks
  /// for; nothing on failure.
  virtual std::optional<Bytes> captureSnapshot(std::uint32_t captureFlags) = 0;
};

}  // namespace vesprun
