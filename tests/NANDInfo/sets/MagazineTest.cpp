#include "buffers/DeviceBuffers.h"
#include "platform/host/documents/JsonForm.h"
#include "support/ControllerTest.h"
#include "vesprun/vesprun.hpp"

namespace vesprun {
namespace {

using Statistics = StatisticsBufferBuilder;

// Statistics by id: host writes accumulate, the free indirection pool is instantaneous.
constexpr std::uint32_t kHostWrites = 4;
constexpr std::uint32_t kIndirectionFree = 12;
constexpr std::uint32_t kVirtualBlocks = 52;
constexpr std::uint32_t kUserStart = 86;

constexpr std::uint64_t kDay = 86'400;
constexpr std::uint64_t kStamp = 0xFFFF'0000;

/// A snapshot with this time stamp; the meta data has more around it.
Statistics snapshot(std::uint64_t stamp) {
  return Statistics().add(680, {1, 2, 3}).add(677, {0xAB00'0000'00CD'EF01 | stamp << 24});
}

class MagazineTest : public ControllerTest {
 protected:
  void snapshotAt(std::uint32_t hours, const Statistics& fields) {
    answer(10, hours, fields.bytes());
  }
  /// The result between the support flag and the error text, without the device's own fields.
  std::string deltas(std::uint32_t deltaWanted, std::uint32_t mode) {
    startController();
    PropertyDict result;
    for (const auto& [key, value] : CopySMagNANDFTLInfo(24, deltaWanted, mode)) {
      if (!key.starts_with("HLT_") || key == "HLT_SM_deltaDays") {
        result.set(key.substr(key.rfind('.') + 1), value);
      }
    }
    return jsonText(result);
  }
};

TEST_F(MagazineTest, FieldsByModeAndPeriod) {
  struct Case {
    std::uint64_t oldStamp;
    std::uint32_t deltaWanted;
    std::uint32_t mode;
    std::string fields;
  };
  const Case cases[] = {{kStamp - kDay, 1, 2, R"(1.0,"IND_pool_free":7,"hostWrites":-40.0})"},
                        {kStamp - kDay, 1, 0, R"(1.0,"hostWrites":-40.0})"},
                        {kStamp - kDay, 1, 1, R"(1.0,"IND_pool_free":7})"},
                        {kStamp - kDay, 1, 3, "1.0}"},
                        {kStamp - kDay, 0, 2, R"(1.0,"IND_pool_free":7,"hostWrites":90.0})"},
                        {kStamp, 1, 2, R"(0.0,"IND_pool_free":7,"hostWrites":90.0})"},
                        {kStamp + kDay / 2, 1, 0, R"(-0.5,"hostWrites":90.0})"}};
  for (const Case& given : cases) {
    snapshotAt(0, snapshot(kStamp).add(kHostWrites, {50}).add(kIndirectionFree, {9}));
    snapshotAt(
        24,
        snapshot(given.oldStamp).add(kIndirectionFree, {7}).add(kHostWrites, {90}).add(47, {3}));
    EXPECT_EQ(deltas(given.deltaWanted, given.mode),
              R"({"IsStatMagSupported":1,"HLT_SM_deltaDays":)" + given.fields);
  }
}

TEST_F(MagazineTest, MissingSnapshotsAndStamps) {
  const Statistics unstamped = Statistics().add(680, {1, 2, 3}).add(kHostWrites, {9});
  for (const bool newestIsStamped : {true, false}) {
    answer(13, 0, unstamped.bytes());
    snapshotAt(0, newestIsStamped ? snapshot(kStamp) : unstamped);
    snapshotAt(24, newestIsStamped ? unstamped : snapshot(kStamp));
    EXPECT_EQ(deltas(1, 2),
              newestIsStamped ? R"({"IsStatMagSupported":1})" : R"({"IsStatMagSupported":0})");
    EXPECT_EQ(GetAPIErrorMessage(),
              "CopyWhitelistedNANDFTLInfo: Unable to gather other stats magazine deltas");
  }
  snapshotAt(0, snapshot(kStamp).add(kHostWrites, {9}));
  EXPECT_EQ(deltas(1, 2), R"({"IsStatMagSupported":1})");

  snapshotAt(24, snapshot(kStamp).add(kHostWrites, {9}));
  EXPECT_EQ(deltas(1, 2),
            R"({"IsStatMagSupported":1,"magazineFWVersion_0":1,"magazineFWVersion_1":2,)"
            R"("magazineFWVersion_2":3,"magazineInstanceMeta":12393905075025473281,)"
            R"("hostWrites":9,"IsQNS1Controller":0})");
  EXPECT_EQ(*CopySMagNANDFTLInfo(24, 1, 2).find("HLT_magazineTimeStamp"), PropertyValue(kStamp));
}

TEST_F(MagazineTest, AverageCyclesOfThePeriod) {
  const std::pair<Statistics, std::string> cases[] = {
      {Statistics().add(kVirtualBlocks, {30}).add(kUserStart, {10}).add(85, {2}),
       R"(,"averageTLCPECycles":2.5,"averageSLCPECycles":12.5})"},
      {Statistics().add(kVirtualBlocks, {10}).add(kUserStart, {10}).add(85, {10}),
       R"(,"averageTLCPECycles":0.0,"averageSLCPECycles":0.0})"},
      {Statistics().add(kVirtualBlocks, {5}).add(kUserStart, {10}),
       R"(,"averageTLCPECycles":-10.0})"},
      {Statistics().add(kVirtualBlocks, {5}), "}"}};
  for (const auto& [now, averages] : cases) {
    answer(13, 0, now.bytes());
    snapshotAt(0, snapshot(kStamp).add(20, {150}).add(84, {300}));
    snapshotAt(24, snapshot(kStamp - kDay).add(20, {100}).add(84, {200}));
    EXPECT_EQ(deltas(1, 2), R"({"IsStatMagSupported":1,"HLT_SM_deltaDays":1.0,"bandErases":50.0,)"
                            R"("intermediateBandErases":100.0)" +
                                averages);
  }
}

TEST_F(MagazineTest, HistoryOfSixPeriods) {
  const auto collected = [](std::uint64_t stamp, std::uint64_t gcWrites,
                            std::vector<std::uint64_t> curve = {}) {
    curve.resize(32);
    return snapshot(stamp).add(16, {gcWrites}).add(702, curve);
  };
  snapshotAt(0, collected(kStamp, 100));
  snapshotAt(4, collected(kStamp - 1, 99, {9, 1, 1}));  // 1 - 0.967 - 0.934 is not above 0
  snapshotAt(8, collected(kStamp - 2, 99, {0, 2}));     // nothing collected
  snapshotAt(12, collected(kStamp - 2, 90, {0, 2}));    // no time passed
  snapshotAt(16, collected(kStamp - 3, 80));            // no step frees a band
  snapshotAt(20, collected(kStamp - 4, 81, {0, 2}));    // counted backwards
  startController();                                    // the snapshot of 24 hours ago is missing
  const double expected[] = {1 / (1 - 0.033 * 2), 0, 0, 1 / (1 - 0.033 * 32), 0, 0};
  const PropertyDict history = CopySMagNANDFTLCustomHistoryInfo(0);
  EXPECT_EQ(history.size(), 6u);
  for (std::size_t i = 0; i < 6; ++i) {
    const std::string name = "HLT_instantaneous_gc_wamp_" + std::to_string(i);
    EXPECT_EQ(history.find(name)->number()->asDouble(), expected[i]) << name;
    EXPECT_EQ(history.find(name)->number()->isFloatingPoint(), expected[i] != 0) << name;
  }
  EXPECT_EQ(CopySMagNANDFTLCustomHistoryInfo(1), PropertyDict());

  snapshotAt(4, collected(kStamp, 100));
  snapshotAt(8, collected(kStamp - 1, 99, {0, 2}));
  startController();  // neither is the newest there
  EXPECT_TRUE(jsonText(CopySMagNANDFTLCustomHistoryInfo(0))
                  .starts_with(R"({"HLT_instantaneous_gc_wamp_0":0,)"
                               R"("HLT_instantaneous_gc_wamp_1":1.0341261633919339,)"));

  snapshotAt(0, Statistics().add(16, {1}));
  startController();
  EXPECT_EQ(jsonText(CopySMagNANDFTLCustomHistoryInfo(1)),
            R"({"com.quill.NANDInfo.ErrorMessage":"Stat Magazine not supported"})");
}

}  // namespace
}  // namespace vesprun
