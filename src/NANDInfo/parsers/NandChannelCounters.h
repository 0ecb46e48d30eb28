#pragma once

#include <array>
#include <cstddef>
#include <cstdint>
#include <string_view>

namespace vesprun {

/// Consecutive counters of one kind, reported as `name[0]`, `name[1]` and so on.
struct CounterField {
  std::string_view name;  ///< empty: not reported
  std::size_t first;      ///< word of `NandChannelCounters`
  std::size_t count;
};

/// All words of `NandChannelCounters`, in order.
inline constexpr CounterField kCounterFields[] = {
    {"readStage", 0, 33},
    {"initialReadStage", 33, 23},
    {"nandStageOfLife", 56, 8},
    {"", 64, 1},
    {"dspExceptionParameter", 65, 38},
    {"readStage18NumOfErrorsBin", 103, 12},
    {"readStage9NumOfErrorsBin", 115, 10},
    {"readStage10NumOfErrorsBin", 125, 10},
    {"readStage17NumOfErrorsBin", 135, 10},
    {"readStage19NumOfErrorsBin", 145, 12},
    {"algoNANDAccessesBin", 157, 8},
    {"retentionIndication", 165, 12},
};

/// The rows of `kCounterFields`.
enum class CounterFieldId : std::uint8_t {
  ReadStage,
  InitialReadStage,
  NandStageOfLife,
  NotUsed,
  DspExceptionParameter,
  ReadStage18NumOfErrorsBin,
  ReadStage9NumOfErrorsBin,
  ReadStage10NumOfErrorsBin,
  ReadStage17NumOfErrorsBin,
  ReadStage19NumOfErrorsBin,
  AlgoNANDAccessesBin,
  RetentionIndication,
};

constexpr const CounterField& counterField(CounterFieldId id) {
  return kCounterFields[static_cast<std::size_t>(id)];
}

/// The counters of one NAND bus.
using NandChannelCounters = std::array<std::uint32_t, 177>;

static_assert([] {
  std::size_t words = 0;
  for (const CounterField& field : kCounterFields) {
    words += field.first == words ? field.count : NandChannelCounters().size() + 1;
  }
  return words == NandChannelCounters().size() &&
         counterField(CounterFieldId::RetentionIndication).first == 165;
}());

}  // namespace vesprun
