#include "NANDInfo/sets/MagazineSnapshot.h"

#include "NANDInfo/sets/FieldNumber.h"
#include "NANDInfo/sets/NANDInfo.h"

namespace vesprun {

std::optional<PropertyDict> copyMagazineSnapshot(std::uint64_t hours) {
  std::optional<PropertyDict> snapshot =
      gatherORUFTLData(false, false, static_cast<std::uint32_t>(hours));
  if (snapshot) {
    if (const Number* meta = numberUnder(*snapshot, kMagazineMetaKey)) {
      snapshot->set(kMagazineTimeStampKey, meta->asUInt64() >> 24 & 0xFFFF'FFFF);
    }
  }
  return snapshot;
}

}  // namespace vesprun
