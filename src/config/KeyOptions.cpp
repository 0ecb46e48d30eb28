#include "config/KeyOptions.h"

#include <algorithm>
#include <string_view>

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
  const bool isReadable = readUnsigned(options, "bucket_interval", read.bucketInterval) &&
                          readUnsigned(options, "sig_fig", read.significantDigits);
  return isReadable ? std::optional(read) : std::nullopt;
}

std::optional<DistributionOptions> DistributionOptions::read(const PropertyDict& options) {
  const PropertyArray* intervals = options.findArray("intervals");
  const bool isReadable =
      intervals != nullptr
          ? std::all_of(intervals->begin(), intervals->end(),
                        [](const PropertyValue& boundary) { return boundary.number() != nullptr; })
          : !options.contains("intervals");
  return isReadable ? std::optional(DistributionOptions{intervals}) : std::nullopt;
}

}  // namespace vesprun
