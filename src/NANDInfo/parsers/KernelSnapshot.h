#pragma once

#include <cstdint>
#include <optional>
#include <span>

namespace vesprun {

// A kernel snapshot is a row of items without gaps, each a 16-byte header (u32 type, u32 size of
// the data, u64 flags, little-endian) and that much data. Items of one container stand between a
// begin and an end item; containers nest. A thread is a container that holds a thread-name item.

/// Looks for the thread called `threadName` (null: no thread is found) in the snapshot's first
/// container and the containers in it. When it is there, returns true and sets `ioStatistics` to
/// the data of the thread's I/O statistics item, a view into the snapshot, or to nothing when the
/// thread has no such item. Otherwise returns false and leaves `ioStatistics` alone.
///
/// Names are compared as C strings, over the size of the name item or 64 bytes, whichever is less;
/// so an item that is shorter than the name matches when it is the name's beginning. Of several
/// name or statistics items in one container the last counts. An item that does not lie wholly
/// within the snapshot ends it. Any nesting is followed, without
/// recursion; the thread is not found when memory runs out for it.
bool getIOStatsWithThreadnameFromSnapData(
    std::span<const std::uint8_t> snapshot, const char* threadName,
    std::optional<std::span<const std::uint8_t>>& ioStatistics);

/// The same, telling through `rest` (unless null) where the walk stopped: what is left of the
/// snapshot from the item at which the container ended whose name decided. `rest` is left alone
/// when no container with a name ended the walk.
///
/// A container goes on after a nested one from where that one reports to have stopped, which is the
/// item that ended it. A nested container without a name reports nothing, and then there is nothing
/// left to go on with: every container around it ends there, compared by the name it has by then.
bool getIOStatsWithThreadnameFromSnapDataHelper(
    std::span<const std::uint8_t> snapshot, const char* threadName,
    std::optional<std::span<const std::uint8_t>>& ioStatistics,
    std::span<const std::uint8_t>* rest);

}  // namespace vesprun
