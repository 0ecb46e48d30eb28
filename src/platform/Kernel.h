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

/// The kernel's own figures.
class Kernel {
 public:
  virtual ~Kernel() = default;

  /// Reads a variable into `buffer`. 0 on success, with the bytes written in `length`; otherwise a
  /// system error number, and `buffer` is untouched. The variable must be of the buffer's size;
  /// text must fit with its final NUL.
  ///
  /// "kern.next_ecc_event" (72 bytes) is a queue: each read takes one event, and an empty queue is
  /// error 2. Where the platform can keep events, one that was read and not acknowledged is in the
  /// queue again after the process.
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
