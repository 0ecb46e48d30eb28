#pragma once

#include <cstdint>
#include <optional>
#include <span>

namespace vesprun {

// A kernel snapshot is a row of items without gaps, each a 16-byte header (u32 type, u32 size of
// the data, u64 flags, little-endian) and that much data. Items of one container stand between a
// begin and an end item; containers nest. A thread is a container that holds a thread-name item.

/// Looks for the thread called `threadName` in the snapshot's first container and those within it.
/// True when it is there: `ioStatistics` is then the data of its I/O statistics item, a view into
/// the snapshot, or nothing when it has no such item. Otherwise `ioStatistics` is left alone; so it
/// is when `threadName` is null or memory runs out.
///
/// Names are compared as C strings, over the size of the name item or 64 bytes, whichever is less:
/// an item that is shorter than the name matches when the name begins with it. Of several name or
/// statistics items in one container the last counts. An item that does not lie wholly within the
/// snapshot ends it.
bool getIOStatsWithThreadnameFromSnapData(
    std::span<const std::uint8_t> snapshot, const char* threadName,
    std::optional<std::span<const std::uint8_t>>& ioStatistics);

/// The same; `rest`, unless null, becomes what is left of the snapshot from the item at which the
/// container ended whose name decided. It is left alone when no container with a name ended the
/// walk.
///
/// A container goes on from the item that ended the one nested in it. A nested container without a
/// name ends every container around it, each compared by the name it has by then.
bool getIOStatsWithThreadnameFromSnapDataHelper(
    std::span<const std::uint8_t> snapshot, const char* threadName,
    std::optional<std::span<const std::uint8_t>>& ioStatistics,
    std::span<const std::uint8_t>* rest);

}  // namespace vesprun
