#include "config/KeyOptions.h"

#include <algorithm>
#include <string_view>

namespace vesprun {
namespace {

/// False when the entry is there and is no number.
bool readUnsigned(const PropertyDict& options, std::string_view name,
                  std::optional<std::uint64_t>& read) {
  const PropertyValue* value = options.find(name);
  if (value != nullptr && value->number() != nullptr) {
    read = value->number()->asUInt64();
  }
  return value == nullptr || read;
}

}  // namespace

std::optional<ScalarOptions> readScalarOptions(const PropertyDict& options) {
  ScalarOptions read;
  if (!readUnsigned(options, "bucket_interval", read.bucketInterval) ||
      !readUnsigned(options, "sig_fig", read.significantDigits)) {
    return std::nullopt;
  }
  return read;
}

std::optional<DistributionOptions> readDistributionOptions(const PropertyDict& options) {
  const PropertyValue* value = options.find("intervals");
  if (value == nullptr) {
    return DistributionOptions{};
  }
  const PropertyArray* intervals = value->array();
  if (intervals == nullptr ||
      !std::all_of(intervals->begin(), intervals->end(),
                   [](const PropertyValue& boundary) { return boundary.number() != nullptr; })) {
    return std::nullopt;
  }
  return DistributionOptions{intervals};
}

}  // namespace vesprun
