#include "NANDInfo/parsers/ORUMSPKeyTable.h"

#include <algorithm>
#include <functional>

namespace vesprun {

// clang-format off
constexpr std::array<ORUMSPKey, kORUMSPKeyCount> ORUMSPKeyTable = {{
    // group 1, elements of 4 bytes
    {4096, "passWithTmodeHard"}, {4097, "passWithTmodeFS1_2b"}, {4098, "passWithTmodeFS1_4b"},
    {4099, "passWithTmodeHard_fast"}, {4100, "passWithTmodeFS1_2b_fast"},
    {4101, "passWithTmodeFS1_4b_fast"}, {4102, "numOfCwFailedInTmodeFS2_EOL"},
    {4103, "numOfCwFailedInTmodeFS2_DSP_EOL"}, {4104, "readAlgoPassWithHardAfterAcq"},
    {4105, "firstReadWasHardWithDefaultBDBFastRead"}, {4106, "readalgoPassWithDS1"},
    {4107, "readalgoPassWithDYCE1"}, {4108, "readalgoPassWithDS2"}, {4109, "readalgoPassWithDYCE2"},
    {4110, "firstReadWasHardWithAcq"}, {4111, "bdbDynamicMovedToEOL_LSB"},
    {4112, "bdbDynamicMovedToEOL_MSB"}, {4113, "bdbDynamicMovedToEOL_USB"},
    {4114, "bdbDynamicMovedToSOL_LSB"}, {4115, "bdbDynamicMovedToSOL_MSB"},
    {4116, "bdbDynamicMovedToSOL_USB"}, {4117, "firstReadWasHardWithDefaultBDB"},
    {4118, "readAlgoPassedThroughSyndSumAcquisition"}, {4119, "readAlgoPassedThroughSlip"},
    {4120, "FS2decodedBitFlips", 11},
    {4121, "slipTrackingAfterFs1ForceFailChangedVthInTicksHist", 4},
    {4122, "readAlgoPassWithFS2_4b_fast"}, {4123, "readAlgoPassWithHardAfterSlip_fast"},
    {4124, "readAlgoPassWithFS12BitAfterSlip_fast"},
    {4125, "readAlgoPassWithFS14BitAfterSlip_fast"}, {4126, "readAlgoPassWithFS3_fast"},
    {4127, "deepSoft1Decoded", 10}, {4128, "deepSoft2Decoded", 10},
    {4129, "readAlgoPassedThroughFS2_2b_fast"}, {4130, "readAlgoPassedThroughFS2_4b_fast"},
    {4131, "readAlgoPassedThroughSlip_fast"}, {4132, "readAlgoPassedThroughFS3_fast"},
    {4133, "readalgoPassWithEXH"}, {4134, "FS1decodedbitflips", 11}, {4135, "readZeroPage"},
    {4136, "readErasedPage"}, {4137, "readFail"}, {4138, "numOfSensesWereSentDuringSyndSumAcq", 5},
    {4139, "numOfSensesWereSentDuringMiniAcq", 3}, {4140, "bdbDefaultMoveFastToNormal"},
    {4141, "bdbDefaultMoveNormalToFast"}, {4142, "readalgoPassWithEXH_DSP"},
    {4143, "readalgoPassWithDS1_DSP"}, {4144, "readalgoPassWithDYCE1_DSP"},
    {4145, "firstReadWasFS2EOL_DSP"}, {4146, "firstReadWasFS2EOL"},
    {4147, "readAlgoPassedThroughFS2_4b"}, {4148, "readAlgoPassWithFS2_4b"},
    {4149, "readAlgoPassedThroughFS2_2b"}, {4150, "readAlgoPassedThroughFS3"},
    {4151, "readAlgoPassedThroughDS1"}, {4152, "readAlgoPassedThroughDS2"},
    {4153, "readAlgoPassWithHardAfterSlip"}, {4154, "readAlgoPassWithFS12BitAfterSlip"},
    {4155, "readAlgoPassWithFS14BitAfterSlip"}, {4156, "readAlgoPassWithFS3"},
    {4157, "readAlgoPassedThroughSyndSumAcquisition_DSP"},
    {4158, "readAlgoPassWithFS12BitAfterAcq"}, {4159, "readAlgoPassWithFS14BitAfterAcq"},
    {4160, "readAlgoPassedThroughDS1_DSP"}, {4161, "numOfSlipTracking"},
    {4162, "bdbDynamicMovedToEOL_QSB"}, {4163, "bdbDynamicMovedToSOL_QSB"},
    {4164, "syndSumAcqConvergedToStaticWalls"}, {4165, "DYCE1_Decoded_Bitflips", 15},
    {4166, "DYCE1_Target_Bitflips", 20}, {4167, "DYCE2_Decoded_Bitflips", 15},
    {4168, "DYCE2_Target_Bitflips", 20}, {4196, "readStageNumOfFails100"},
    {4197, "readStageNumOfFails101"}, {4198, "readStage100"}, {4199, "readStage101", 4},
    {4200, "initialReadStage100"}, {4201, "readStage102"}, {4202, "initialReadStage101"},
    {4203, "nandStageOfLife100"}, {4204, "nandStageOfLife101"}, {4205, "readStageNumOfFails102", 4},
    {4206, "initialReadStage102"}, {4207, "readStage103"}, {4208, "readStage104"},
    {4209, "readStage105", 4}, {4210, "readStage106", 4}, {4211, "dspExceptionParameter100", 4},
    {4212, "dspExceptionParameter101", 4}, {4213, "initialReadStage103"},
    {4214, "initialReadStage104"}, {4215, "readStage107", 4}, {4216, "readStage108", 4},
    {4217, "nandStageOfLife102"}, {4218, "nandStageOfLife103"}, {4219, "nandStageOfLife104"},
    {4220, "dspExceptionParameter102", 4}, {4221, "dspExceptionParameter103", 4},
    {4222, "dspExceptionParameter104", 4}, {4223, "dspExceptionParameter105", 4},
    {4224, "dspExceptionParameter106", 4}, {4225, "dspExceptionParameter107", 4},
    {4226, "dspExceptionParameter108", 4}, {4227, "dspExceptionParameter109", 4},
    {4228, "dspExceptionParameter110", 4}, {4229, "dspExceptionParameter111", 4},
    {4230, "dspExceptionParameter112", 4}, {4231, "dspExceptionParameter113", 4},
    {4232, "readStageNumOfFails108", 64}, {4233, "readStageNumOfFails103", 64},
    {4234, "readStageNumOfFails104", 4}, {4235, "readStageNumOfFails105", 4},
    {4236, "readStageNumOfFails106", 4}, {4237, "readStageNumOfFails107", 4},
    {4238, "readStage109", 4}, {4239, "readStage110", 4}, {4240, "readStageNumOfErrorsBin100", 20},
    {4241, "dspExceptionParameter114", 20}, {4242, "dspExceptionParameter115"},
    {4243, "dspExceptionParameter116"}, {4244, "dspExceptionParameter117"},
    {4245, "dspExceptionParameter118"}, {4246, "dspExceptionParameter119"},
    {4247, "dspExceptionParameter120"}, {4248, "dspExceptionParameter121"}, {4249, "cbdr_ref_1"},
    {4250, "cbdr_ref_2"}, {4251, "cbdr_outlier"}, {4252, "cbdr_step_1", 10},
    {4253, "cbdr_step_2", 10}, {4254, "cbdr_step_3", 10}, {4255, "cbdr_step_4", 10},
    {4256, "cbdr_step_5", 10}, {4257, "cbdr_step_6", 10}, {4258, "cbdr_step_7", 10},
    {4259, "dspExceptionParameter122", 20}, {4260, "dspExceptionParameter123", 8},
    // group 2, elements of 4 bytes
    {8193, "avg_rd_window_size", 5}, {8194, "num_zq_failures"}, {8195, "lower_die_temperature", 16},
    {8196, "higher_die_temperature", 16}, {8197, "number_of_sram_flips"},
    {8198, "number_of_reset_failures"}, {8199, "device_config"},
    {8200, "number_of_throttling_events"}, {8201, "link_speed_recoveries"}, {8202, "fw_updates"},
    {8203, "maintenance_backup_to_main"}, {8204, "maintenance_main_to_backup"},
    {8205, "boot_block_erase_failures"}, {8206, "boot_block_program_failures"},
    {8207, "boot_block_read_verify_failures"}, {8208, "boot_block_read_failures"},
    {8209, "boot_block_refresh"}, {8210, "boot_block_convert_to_main"},
    {8211, "boot_block_read_source_changed"}, {8212, "open_blocks_hist", 4},
    {8213, "random_read_hit_ratio_hist", 6}, {8214, "active_time_hist", 5},
    {8215, "rd_retraining_failures", 2}, {8216, "wr_retraining_failures", 2},
    {8217, "auto_skip", 5}, {8218, "number_of_dcc_pass_after_retry"},
    {8219, "number_of_dcc_failures"}, {8220, "open_blocks_hist", 7},
    {8221, "max_size_open_blocks_list"}, {8222, "gps_max_num_of_failures"},
    {8223, "gps_num_of_failures_max_overflow"}, {8224, "active_time_hist", 8},
    {8225, "num_auto_program_cache_terminations"}, {8226, "number_of_read_cache_auto_terminations"},
    {8227, "external_etags_usage_hist", 7}, {8228, "internal_etags_usage_hist", 4},
    {8229, "max_heap_usage"}, {8230, "rom_num_hard_resets", 6}, {8231, "lower_die_temperature", 16},
    {8232, "higher_die_temperature", 16}, {8233, "random_read_hit_ratio_hist", 6},
    {8234, "msp_number_sram_flips"}, {8235, "boot_time_normal_power", 5},
    {8236, "boot_time_low_power", 5}, {8237, "active_time_bw_pg_hist", 10},
    {8238, "active_time_bw_pg_min"}, {8239, "active_time_bw_pg_max"},
    {8240, "mdll_relative_offset", 5}, {8241, "num_pg_regrets"},
    {8242, "spi_image_overall_duration_acc"}, {8243, "spi_image_cw_fetch_duration_acc"},
    {8244, "spi_image_cw_fetch_duration_hist", 5}, {8245, "spi_num_uses"},
    {8246, "e2e_error_count_tmode", 5}, {8247, "rd_window_dist", 9},
    {8248, "extended_rd_window_diff_dist", 9}, {8249, "rd_retraining_failures_v2", 2},
    // group 3, elements of 8 bytes
    {12288, "readStageNumOfFails200"}, {12289, "initialReadStage200"},
    {12290, "initialReadStage201"}, {12291, "readStageNumOfFails201"},
    {12292, "initialReadStage202"}, {12293, "initialReadStage203"},
    {12294, "readStageNumOfFails202"}, {12295, "readStageNumOfFails203"},
    {12296, "initialReadStage204"}, {12297, "initialReadStage205"}, {12298, "initialReadStage206"},
    {12299, "initialReadStage207"}, {12300, "initialReadStage208"}, {12301, "initialReadStage209"},
    {12302, "readStage200"}, {12303, "readStage201", 4}, {12304, "readStage202", 4},
    {12305, "initialReadStage210", 4}, {12306, "initialReadStage211"}, {12307, "readStage203"},
    {12308, "readStage204"}, {12309, "readStage205"}, {12310, "readStage206"},
    {12311, "readStage207"}, {12312, "readStage208"}, {12313, "readStage209", 4},
    {12314, "readStage210", 4}, {12315, "initialReadStage212"}, {12316, "initialReadStage213"},
    {12317, "readStage211"}, {12318, "readStage212"}, {12319, "readStage213"},
    {12320, "readStage214"}, {12321, "readStage215"},
    // group 4, elements of 8 bytes
    {16384, "fw_version_identifier"}, {16385, "random_read_size_ratio", 5},
    {16386, "number_gracefull_read_terminations"}, {16387, "active_time_bw_pg_acc"},
    {16388, "num_pg_events"},
}};
// clang-format on

namespace {

constexpr std::size_t kGroups = 5;             // group 0 holds none
constexpr std::size_t kIndexesOfAGroup = 165;  // no index of any group is larger
constexpr std::uint8_t kNoMSPRow = 0xFF;

using Rows = std::array<std::array<std::uint8_t, kIndexesOfAGroup>, kGroups>;

constexpr Rows kRowOfKey = [] {
  Rows rows{};
  for (auto& group : rows) {
    group.fill(kNoMSPRow);
  }
  for (std::size_t row = 0; row < ORUMSPKeyTable.size(); ++row) {
    const std::uint16_t key = ORUMSPKeyTable[row].key;
    rows[ORUMSPKey::groupOf(key)][ORUMSPKey::indexOf(key)] = static_cast<std::uint8_t>(row);
  }
  return rows;
}();

constexpr std::array<std::size_t, kGroups> kKeysOfGroup = [] {
  std::array<std::size_t, kGroups> keys{};
  for (const ORUMSPKey& key : ORUMSPKeyTable) {
    ++keys[ORUMSPKey::groupOf(key.key)];
  }
  return keys;
}();

static_assert(kKeysOfGroup == std::array<std::size_t, kGroups>{0, 138, 57, 34, 5});
static_assert(std::ranges::adjacent_find(ORUMSPKeyTable, std::ranges::greater_equal(),
                                         &ORUMSPKey::key) == ORUMSPKeyTable.end());
static_assert(ORUMSPKeyTable.size() < kNoMSPRow);

constexpr char kMSPSeparator[] = "";

}  // namespace

KnownNames MSPNamesOf(const ORUMSPKey& row) {
  return KnownNamesOf<ORUMSPKeyTable, kMSPSeparator>::of(row);
}

const ORUMSPKey* findORUMSPKey(std::uint16_t key) {
  const std::uint32_t group = ORUMSPKey::groupOf(key);
  const std::uint32_t index = ORUMSPKey::indexOf(key);
  if (group >= kGroups || index >= kIndexesOfAGroup) {
    return nullptr;
  }
  const std::uint8_t row = kRowOfKey[group][index];
  return row != kNoMSPRow ? &ORUMSPKeyTable[row] : nullptr;
}

}  // namespace vesprun
