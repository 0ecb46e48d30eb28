#include <array>
#include <optional>
#include <string>
#include <string_view>

#include "NANDInfo/Magazine.h"
#include "NANDInfo/controller/EntryPoint.h"
#include "NANDInfo/parsers/APIErrorMessage.h"
#include "NANDInfo/sets/FieldNumber.h"
#include "NANDInfo/sets/MagazineSnapshot.h"

namespace vesprun {
namespace {

constexpr std::uint64_t kHoursPerPeriod = 4;

constexpr std::array<std::string_view, 6> kHLT_instantaneous_gc_wamp_array{
    "HLT_instantaneous_gc_wamp_0", "HLT_instantaneous_gc_wamp_1", "HLT_instantaneous_gc_wamp_2",
    "HLT_instantaneous_gc_wamp_3", "HLT_instantaneous_gc_wamp_4", "HLT_instantaneous_gc_wamp_5"};

/// Did garbage collection write anything from `older` to `newer`? Only time stamps that say that
/// time has passed make the difference of the counters count.
bool collectedGarbage(const PropertyDict& newer, const PropertyDict& older) {
  const Number* newerStamp = numberUnder(newer, kMagazineTimeStampKey);
  const Number* olderStamp = numberUnder(older, kMagazineTimeStampKey);
  const Number* newerWrites = numberUnder(newer, "gcWrites");
  const Number* olderWrites = numberUnder(older, "gcWrites");
  return newerStamp != nullptr && olderStamp != nullptr && newerWrites != nullptr &&
         olderWrites != nullptr && newerStamp->asUInt64() > olderStamp->asUInt64() &&
         newerWrites->asDouble() - olderWrites->asDouble() >= 1;
}

/// What is invalid in a band of validity step `step`, as a share of the band. Below 0 from step 31.
double invalidShare(unsigned step) { return 1 - 0.033 * step; }

/// Takes bands from the validity curve, step by step, until they make one free band; the step at
/// which that is reached tells how much had to be written for it.
double writeAmplification(const PropertyDict& snapshot) {
  constexpr unsigned kLastStep = 32;
  double missing = 1.0;
  unsigned step = 1;
  for (; step < kLastStep; ++step) {
    if (const Number* bands = numberUnder(snapshot, "vcurve_" + std::to_string(step))) {
      missing -= invalidShare(step) * bands->asDouble();
    }
    if (missing <= 0) {
      break;
    }
  }
  return 1 / invalidShare(step);
}

}  // namespace

PropertyDict CopySMagNANDFTLCustomHistoryInfo(std::uint32_t skipHistory) noexcept {
  return runEntryPoint(__func__, [&]() -> PropertyDict {
    std::optional<PropertyDict> newer = copyMagazineSnapshot(0);
    const Number* isSupported = newer ? numberUnder(*newer, kIsStatMagSupportedKey) : nullptr;
    if (isSupported != nullptr && isSupported->asInt32() == 0) {
      return {{std::string(kNANDInfoErrorMessageKey), GetAPIErrorMessage()}};
    }
    PropertyDict history;
    if (skipHistory != 0) {
      return history;
    }
    std::uint64_t hours = 0;
    for (const std::string_view name : kHLT_instantaneous_gc_wamp_array) {
      hours += kHoursPerPeriod;
      std::optional<PropertyDict> older = copyMagazineSnapshot(hours);
      if (newer && older && collectedGarbage(*newer, *older)) {
        history.set(name, writeAmplification(*older));
      } else {
        history.set(name, std::int32_t{0});
      }
      newer = std::move(older);
    }
    return history;
  });
}

}  // namespace vesprun
