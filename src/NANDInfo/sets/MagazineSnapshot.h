#pragma once

#include <cstdint>
#include <optional>
#include <string_view>

#include "common/PropertyDict.h"

namespace vesprun {

// A stats-magazine snapshot: the FTL fields as they stood some hours back.

inline constexpr std::string_view kIsStatMagSupportedKey = "com.quill.NANDInfo.IsStatMagSupported";
inline constexpr std::string_view kMagazineMetaKey = "magazineInstanceMeta";
inline constexpr std::string_view kMagazineTimeStampKey = "HLT_magazineTimeStamp";

/// The snapshot of about `hours` hours ago; 0: the newest. When it carries the magazine's own data
/// ("magazineInstanceMeta"), it gets its time stamp in seconds as "HLT_magazineTimeStamp", an
/// unsigned 64-bit number that fits 32 bits. Nothing, with the error recorded, when it cannot be
/// had. Of `hours` the low 32 bits count.
std::optional<PropertyDict> copyMagazineSnapshot(std::uint64_t hours);

}  // namespace vesprun
