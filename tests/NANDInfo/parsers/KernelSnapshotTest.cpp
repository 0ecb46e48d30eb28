#include "NANDInfo/parsers/KernelSnapshot.h"

#include <gmock/gmock.h>

#include "buffers/DeviceBuffers.h"

namespace vesprun {
namespace {

constexpr int kAbsent = -1;
constexpr int kNoStatistics = -2;

/// The written bytes of the thread "VM_swapout".
int look(const Bytes& snapshot, const char* name = "VM_swapout") {
  std::optional<std::span<const std::uint8_t>> statistics;
  if (!getIOStatsWithThreadnameFromSnapData(snapshot, name, statistics)) {
    EXPECT_FALSE(statistics);
    return kAbsent;
  }
  return statistics ? (*statistics)[24] : kNoStatistics;
}

using B = SnapshotBuilder;

TEST(KernelSnapshot, FindsTheThreadInTheFirstContainer) {
  const std::pair<B, int> cases[] = {
      {B().thread(1, "VM_swapout", 7), 7},
      {B().begin(1).name("VM_swapout", 16).written(7), 7},
      {B().item(48, Bytes(5)).item(17, Bytes(3)).thread(1, "VM_swapout", 7), 7},
      {B().begin(1).thread(2, "idle", 3).thread(3, "VM_swapout", 7).end(1), 7},
      {B().begin(1).item(17, Bytes(9)).item(32, {}).item(47, Bytes(4)).thread(2, "VM_swapout", 7),
       7},
      {B().begin(1).begin(2).begin(3).thread(4, "VM_swapout", 7), 7},
      {B().begin(1).written(7).name("VM_swapout").end(1), 7},
      {B().begin(1).written(1).name("VM_swapout").written(7), 7},
      {B().begin(1).name("VM_swapout").name("idle").written(7), kAbsent},
      {B().begin(1).name("VM_swapout").end(1).written(7), kNoStatistics},
      {B().begin(1).end(2).name("VM_swapout").end(3).written(7), 7},
      {B().item(19, Bytes(3), 5).begin(1).item(19, Bytes(3), 2).thread(3, "VM_swapout", 7), 7},
      {B().begin(1).name("VM_swapout").thread(2, "idle", 3).written(7), 7},
      {B().begin(1).name("task").thread(2, "VM_swapout", 7), 7},
      {B().begin(1).thread(1, "idle", 3).thread(2, "VM_swapout", 7), kAbsent},
      {B().begin(1).begin(2).end(2).thread(3, "VM_swapout", 7).end(1), kAbsent},
      {B().begin(1).name("VM_swapout").written(7).begin(2).end(2).written(8), 7},
      {B().thread(1, "VM_swapin", 7), kAbsent},
      {B().thread(1, "VM_swapout2", 7), kAbsent},
      {B().begin(1).name("VM_swap").written(7), 7},
      {B().thread(1, "idle", 3).thread(2, "VM_swapout", 7), kAbsent},
      {B().bufferEnd().thread(1, "VM_swapout", 7), kAbsent},
      {B().begin(1).thread(2, "idle", 3).bufferEnd().thread(3, "VM_swapout", 7), kAbsent},
      {B(), kAbsent}};
  for (const auto& each : cases) {
    EXPECT_EQ(look(each.first.bytes), each.second) << &each - cases;
  }
  EXPECT_EQ(look(B().thread(1, "VM_swapout", 7).bytes, nullptr), kAbsent);
  // The first 64 bytes are compared, whether or not more follow.
  const std::string same(63, 'n');
  const std::pair<std::string, int> names[] = {
      {same, 7}, {same + 'n', 7}, {same + "nx", 7}, {same + 'x', kAbsent}, {same + '\0', kAbsent}};
  for (const auto& [name, expected] : names) {
    EXPECT_EQ(look(B().begin(1).name(name).written(7).bytes, (same + "nnnn").c_str()), expected);
  }
  EXPECT_EQ(look(B().begin(1).name(same + 'n').written(7).bytes, (same + 'n').c_str()), 7);
}

TEST(KernelSnapshot, EndsAtAnItemThatIsCutOff) {
  const B whole = B().begin(1).thread(2, "idle", 3).begin(3).name("VM_swapout", 16).written(7);
  const std::size_t nameEnd = whole.bytes.size() - 48;
  for (std::size_t size = 0; size <= whole.bytes.size(); ++size) {
    const Bytes cut(whole.bytes.begin(), whole.bytes.begin() + static_cast<std::ptrdiff_t>(size));
    const int expected = size < nameEnd ? kAbsent : size < whole.bytes.size() ? kNoStatistics : 7;
    EXPECT_EQ(look(cut), expected) << size;
  }
}

TEST(KernelSnapshot, FollowsAnyNesting) {
  B deep;
  for (std::uint64_t id = 0; id < 200'000; ++id) {
    deep.begin(id);
  }
  EXPECT_EQ(look(deep.bytes), kAbsent);
  EXPECT_EQ(look(deep.thread(200'000, "VM_swapout", 7).bytes), 7);
}

}  // namespace
}  // namespace vesprun
