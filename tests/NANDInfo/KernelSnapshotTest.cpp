#include "NANDInfo/KernelSnapshot.h"

#include <gtest/gtest.h>

#include "support/SnapshotBuilder.h"

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

TEST(KernelSnapshot, findsTheThreadInTheFirstContainer) {
  const std::string longName(70, 'n');
  struct Case {
    const char* what;
    SnapshotBuilder snapshot;
    int result;
    const char* name = "VM_swapout";
  };
  const Case cases[] = {
      {"alone", B().thread(1, "VM_swapout", 7), 7},
      {"without its end", B().begin(1).name("VM_swapout", 16).written(7), 7},
      {"behind other items", B().item(48, Bytes(5)).item(17, Bytes(3)).thread(1, "VM_swapout", 7),
       7},
      {"in a task", B().begin(1).thread(2, "idle", 3).thread(3, "VM_swapout", 7).end(1), 7},
      {"among arrays",
       B().begin(1).item(17, Bytes(9)).item(32, {}).item(47, Bytes(4)).thread(2, "VM_swapout", 7),
       7},
      {"deeper", B().begin(1).begin(2).begin(3).thread(4, "VM_swapout", 7), 7},
      {"statistics before the name", B().begin(1).written(7).name("VM_swapout").end(1), 7},
      {"the last statistics count", B().begin(1).written(1).name("VM_swapout").written(7), 7},
      {"the last name counts", B().begin(1).name("VM_swapout").name("idle").written(7), kAbsent},
      {"no statistics", B().begin(1).name("VM_swapout").end(1).written(7), kNoStatistics},
      {"ends of others are stepped over", B().begin(1).end(2).name("VM_swapout").end(3).written(7),
       7},
      {"too small a begin is no container",
       B().item(19, Bytes(3), 5).begin(1).item(19, Bytes(3), 2).thread(3, "VM_swapout", 7), 7},
      {"the task's own name", B().begin(1).name("VM_swapout").thread(2, "idle", 3).written(7), 7},
      {"a task with a name of its own", B().begin(1).name("task").thread(2, "VM_swapout", 7), 7},
      {"a nested container with the outer identifier ends both",
       B().begin(1).thread(1, "idle", 3).thread(2, "VM_swapout", 7), kAbsent},
      {"a nameless nested container ends the ones around it",
       B().begin(1).begin(2).end(2).thread(3, "VM_swapout", 7).end(1), kAbsent},
      {"what was seen before a nameless nested one counts",
       B().begin(1).name("VM_swapout").written(7).begin(2).end(2).written(8), 7},
      {"other name", B().thread(1, "VM_swapin", 7), kAbsent},
      {"a longer name", B().thread(1, "VM_swapout2", 7), kAbsent},
      {"cut name", B().begin(1).name("VM_swap").written(7), 7},
      {"64 characters are compared", B().begin(1).name(longName.substr(0, 64) + "x").written(7), 7,
       longName.c_str()},
      {"second container at the top", B().thread(1, "idle", 3).thread(2, "VM_swapout", 7), kAbsent},
      {"behind the buffer's end", B().bufferEnd().thread(1, "VM_swapout", 7), kAbsent},
      {"in a task that the buffer's end cuts",
       B().begin(1).thread(2, "idle", 3).bufferEnd().thread(3, "VM_swapout", 7), kAbsent},
      {"no name", B().thread(1, "VM_swapout", 7), kAbsent, nullptr},
      {"nothing", B(), kAbsent},
  };
  for (const Case& each : cases) {
    EXPECT_EQ(look(each.snapshot.bytes, each.name), each.result) << each.what;
  }
}

TEST(KernelSnapshot, endsAtAnItemThatIsCutOff) {
  const B whole = B().begin(1).thread(2, "idle", 3).begin(3).name("VM_swapout", 16).written(7);
  const std::size_t nameEnd = whole.bytes.size() - 48;
  for (std::size_t size = 0; size <= whole.bytes.size(); ++size) {
    const Bytes cut(whole.bytes.begin(), whole.bytes.begin() + static_cast<std::ptrdiff_t>(size));
    const int expected = size < nameEnd ? kAbsent : size < whole.bytes.size() ? kNoStatistics : 7;
    EXPECT_EQ(look(cut), expected) << size;
  }
  B tooLong = B().begin(1).name("VM_swapout");
  tooLong.bytes[20 + 4] = tooLong.bytes[20 + 5] = tooLong.bytes[20 + 6] = tooLong.bytes[20 + 7] =
      0xFF;
  EXPECT_EQ(look(tooLong.bytes), kAbsent);
}

TEST(KernelSnapshot, followsAnyNesting) {
  B deep;
  for (std::uint64_t id = 0; id < 200'000; ++id) {
    deep.begin(id);
  }
  EXPECT_EQ(look(deep.bytes), kAbsent);
  EXPECT_EQ(look(deep.thread(200'000, "VM_swapout", 7).bytes), 7);
}

TEST(KernelSnapshot, tellsWhereTheNamedContainerEnded) {
  const auto restOf = [](const Bytes& snapshot) {
    constexpr std::size_t kUntold = 999;
    const Bytes untold(kUntold);
    std::span<const std::uint8_t> rest = untold;
    std::optional<std::span<const std::uint8_t>> statistics;
    getIOStatsWithThreadnameFromSnapDataHelper(snapshot, "VM_swapout", statistics, &rest);
    return rest.size() == kUntold ? kAbsent : static_cast<int>(rest.size());
  };
  EXPECT_EQ(restOf(B().thread(1, "VM_swapout", 7).bytes), 16);
  EXPECT_EQ(restOf(B().thread(1, "idle", 7).item(48, Bytes(4)).bytes), 36);
  EXPECT_EQ(restOf(B().begin(1).name("task").thread(2, "VM_swapout", 7).end(1).bytes), 32);
  EXPECT_EQ(restOf(B().begin(1).name("task").begin(2).end(2).end(1).bytes), 0);
  EXPECT_EQ(restOf(B().begin(1).thread(2, "idle", 7).end(1).bytes), kAbsent);
}

}  // namespace
}  // namespace vesprun
