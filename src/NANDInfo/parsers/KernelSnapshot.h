#pragma once

#include <cstdint>
#include <optional>
#include <span>

namespace vesprun {

// A kernel snapshot is a row of items without gaps: a 16-byte header (u32 type, u32 size of the
// data, u64 flags, little-endian) and the data. A begin and an end item enclose a container;
// containers nest. A thread is a container with a thread-name item.

/// Looks for the thread `threadName` in the snapshot's first container. If found: true, and
/// `ioStatistics` is the data of its I/O statistics item, a view into the snapshot, or nothing
/// without the item. Else false, and `ioStatistics` is untouched; so too for a null `threadName`
/// and when memory runs out.
///
/// Names are compared as C strings over the name item's size, at most 64 bytes: a shorter item
/// matches if the name begins with it. Of several name or statistics items in a container the last
/// counts. An item that exceeds the snapshot ends it.
bool getIOStatsWithThreadnameFromSnapData(
    std::span<const std::uint8_t> snapshot, const char* threadName,
    std::optional<std::span<const std::uint8_t>>& ioStatistics);

/// The same; `rest`, unless null, becomes the remaining snapshot from the item that ended the
/// decisive container. It is untouched when no container with a name ended the walk.
///
/// A container continues after the one nested in it. A nested container without a name ends every
/// container around it, each compared by its name so far.
bool getIOStatsWithThreadnameFromSnapDataHelper(
    std::span<const std::uint8_t> snapshot, const char* threadName,
    std::optional<std::span<const std::uint8_t>>& ioStatistics,
    std::span<const std::uint8_t>* rest);

}  // namespace vesprun
