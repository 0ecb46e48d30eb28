#include "NANDInfo/structuredlog/WriteAmplification.h"

#include <cstdint>
#include <limits>
#include <optional>

#include "platform/Platform.h"

namespace vesprun {
namespace {

static_assert(std::numeric_limits<double>::is_iec559, "a division by 0 is infinite or NaN");

constexpr unsigned kBlockShift = 12;  // host writes are counted in blocks of 4 KiB
constexpr double kDefaultThreshold = 2.0;
constexpr double kMaxThreshold = 10.0;

double threshold() {
  const std::optional<PropertyValue> preference =
      platform().preferences().LGSPreferencesGetValue("userWAmp", "com.quill.NANDInfo");
  const Number* number = preference ? preference->number() : nullptr;
  if (number == nullptr || !number->isFloatingPoint()) {
    return kDefaultThreshold;
  }
  const double value = number->asDouble();
  return value > 0.0 && value < kMaxThreshold ? value : kDefaultThreshold;
}

/// Blocks written by so many band erases, for each block that the host wrote.
float writesPerHostWrite(std::uint64_t erases, std::uint64_t blocksPerBand,
                         std::uint64_t hostWrites) {
  return static_cast<float>(static_cast<double>(erases) * static_cast<double>(blocksPerBand) /
                            static_cast<double>(hostWrites));
}

}  // namespace

WriteAmplification writeAmplification(const ORUStatsContext& statistics) {
  // The product wraps in 32 bits.
  const std::uint32_t bytesPerBand = statistics.pagesPerVirtualBlock * statistics.bytesPerPage;
  std::uint64_t slcBlocksPerBand = 0;
  std::uint64_t intermediateErases = 0;
  statistics.fields.forEach([&](const GenericParserCxt::Field& field) {
    if (field.name == "pagesPerVirtualBlockSlc") {
      slcBlocksPerBand = field.value * statistics.bytesPerPage >> kBlockShift;
    } else if (field.name == "intermediateBandErases") {
      intermediateErases = field.value;
    }
  });
  WriteAmplification amplification;
  amplification.user =
      writesPerHostWrite(statistics.bandErases, bytesPerBand >> kBlockShift, statistics.hostWrites);
  if (slcBlocksPerBand != 0 && intermediateErases != 0) {
    amplification.intermediate =
        writesPerHostWrite(intermediateErases, slcBlocksPerBand, statistics.hostWrites);
  }
  return amplification;
}

bool isAboveWriteAmplificationThreshold(float userWamp) {
  return static_cast<double>(userWamp) > threshold();
}

}  // namespace vesprun
