#pragma once

#include <cstdint>
#include <optional>
#include <span>
#include <string>

#include "common/PropertyValue.h"

namespace vesprun {

/// Nanoseconds per tick as a fraction.
struct TickRatio {
  std::uint32_t numerator;
  std::uint32_t denominator;
};

/// What the kernel tells of itself.
class Kernel {
 public:
  virtual ~Kernel() = default;

  /// Reads the variable `name` into `buffer`. On success returns 0 and sets `length` to the bytes
  /// written. Otherwise returns the system error number (never 0), and `buffer` is untouched. A
  /// variable whose size differs from the buffer's is not read, but for text, which must fit with
  /// its final NUL.
  ///
  /// "kern.next_ecc_event" (72 bytes) is a queue: each successful read takes one event out of it.
  /// An empty queue is error 2. Where the platform can keep an event, one that was read and not
  /// acknowledged is in the queue again when the process has ended.
  virtual int sysctlbyname(const std::string& name, std::span<std::uint8_t> buffer,
                           std::size_t& length) = 0;

  /// Lets go of the ECC event that was read last. False when it will be read again.
  virtual bool acknowledgeECCEvent() = 0;

  /// Bytes of a memory page.
  virtual std::uint64_t pageSize() = 0;

  /// A counter that rises steadily while the system is awake.
  virtual std::uint64_t monotonicTicks() = 0;

  /// Nothing when the kernel does not tell.
  virtual std::optional<TickRatio> tickRatio() = 0;

  /// Captures a snapshot of the kernel: typed items, one behind the other. `captureFlags` says what
  /// it is to hold. Nothing when it cannot be had.
  virtual std::optional<Bytes> captureSnapshot(std::uint32_t captureFlags) = 0;
};

}  // namespace vesprun
