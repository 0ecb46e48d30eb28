#include "ExactCopy.h"
#include "NANDInfo/parsers/KernelSnapshot.h"
#include "Require.h"

using namespace vesprun;

namespace {

bool liesIn(std::span<const std::uint8_t> part, std::span<const std::uint8_t> whole) {
  return part.empty() ||
         (part.data() >= whole.data() && part.data() + part.size() <= whole.data() + whole.size());
}

}  // namespace

/// What is found lies in the snapshot, and the longer form of the look-up finds the same.
extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* bytes, std::size_t size) {
  const ExactCopy snapshot(bytes, size);
  std::optional<std::span<const std::uint8_t>> statistics;
  const bool found =
      getIOStatsWithThreadnameFromSnapData(snapshot.span(), "VM_swapout", statistics);
  require(found || !statistics, "nothing is set when nothing is found");
  require(!statistics || liesIn(*statistics, snapshot.span()), "statistics lie in the snapshot");

  std::optional<std::span<const std::uint8_t>> again;
  std::span<const std::uint8_t> rest;
  require(getIOStatsWithThreadnameFromSnapDataHelper(snapshot.span(), "VM_swapout", again, &rest) ==
              found,
          "both look-ups find the same");
  require(again.has_value() == statistics.has_value(), "both find statistics or none");
  require(liesIn(rest, snapshot.span()), "the rest lies in the snapshot");
  require(!getIOStatsWithThreadnameFromSnapData(snapshot.span(), nullptr, again),
          "no thread has no name");
  return 0;
}
