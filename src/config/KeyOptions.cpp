#include "config/KeyOptions.h"

#include <algorithm>
#include <cmath>

namespace vesprun {
namespace {

/// False when the entry is there but not a number.
bool readUnsigned(const PropertyDict& options, std::string_view name,
                  std::optional<std::uint64_t>& read) {
  if (const Number* number = options.findNumber(name)) {
    read = number->asUInt64();
    return true;
  }
  return !options.contains(name);
}

}  // namespace

std::optional<ScalarOptions> ScalarOptions::read(const PropertyDict& options) {
  ScalarOptions read;
  const bool isReadable = readUnsigned(options, kBucketInterval, read.bucketInterval) &&
                          readUnsigned(options, kSignificantDigits, read.significantDigits);
  return isReadable ? std::optional(read) : std::nullopt;
}

std::optional<DistributionOptions> DistributionOptions::read(const PropertyDict& options) {
  const PropertyArray* intervals = options.findArray(kIntervals);
  const bool isReadable =
      intervals != nullptr
          ? std::all_of(intervals->begin(), intervals->end(),
                        [](const PropertyValue& boundary) { return boundary.number() != nullptr; })
          : !options.contains(kIntervals);
  return isReadable ? std::optional(DistributionOptions{intervals}) : std::nullopt;
}

bool DistributionOptions::operator==(const DistributionOptions& other) const {
  if (intervals == nullptr || other.intervals == nullptr) {
    return intervals == other.intervals;
  }
  return std::equal(intervals->begin(), intervals->end(), other.intervals->begin(),
                    other.intervals->end(), [](const auto& left, const auto& right) {
                      const bool areNaN = std::isnan(left.number()->asDouble()) &&
                                          std::isnan(right.number()->asDouble());
                      return areNaN || left == right;
                    });
}

EntryMetadata EntryMetadata::read(const PropertyDict* options, const PropertyDict* about) {
  EntryMetadata metadata;
  for (const PropertyDict* from : {about, options}) {
    if (from != nullptr) {
      const auto take = [](const auto* found, auto& member) {
        member = found != nullptr ? found : member;
      };
      take(from->findString(kOwner), metadata.owner);
      take(from->findString(kReason), metadata.reason);
      take(from->findDate(kExpires), metadata.expires);
    }
  }
  return metadata;
}

}  // namespace vesprun
