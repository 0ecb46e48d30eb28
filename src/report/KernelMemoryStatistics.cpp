#include <array>
#include <cstring>
#include <limits>
#include <string>

#include "platform/Platform.h"
#include "report/TBReport.h"

namespace vesprun {
namespace {

/// What must hold for a row to be offered. Each is read once for a report, where its first row
/// stands, and yields a number for its rows.
enum class Gate {
  Always,
  CorruptionsFound,     ///< "vm.vmtc_total" is not 0
  PageoutsRead,         ///< pages written out by freezing
  GibibytePagedOut,     ///< the same in bytes, at least a gibibyte
  ConsideredRead,       ///< processes considered for freezing
  BelowThresholdRead,   ///< how often free memory was below the threshold
  TenRefreezesCounted,  ///< refreezes, at least 10
};
constexpr std::size_t kGateCount = 7;

/// How a row's value comes from its variable and the number of its gate.
enum class Value {
  Read32,       ///< 2^32 − 1 when the read fails
  Read64,       ///< −1 when the read fails
  SwapTotal,    ///< the first field of the swap record, −1 when the read fails
  GateNumber,   ///< no variable
  PerGibibyte,  ///< variable ÷ gibibytes of the gate
  Percentage,   ///< variable ÷ gate × 100
  Quotient,     ///< variable ÷ gate in integers
};

struct Row {
  const char* key;
  Gate gate;
  Value value;
  const char* variable;
};

constexpr std::array kRows = {
    Row{"com.quill.kernel.vmtc_total", Gate::CorruptionsFound, Value::Read32, "vm.vmtc_total"},
    Row{"com.quill.kernel.vmtc_one_bit_flip", Gate::CorruptionsFound, Value::Read32,
        "vm.vmtc_one_bit_flip"},
    Row{"com.quill.kernel.vmtc_not_found", Gate::CorruptionsFound, Value::Read32,
        "vm.vmtc_not_found"},
    Row{"com.quill.kernel.vmtc_1_byte", Gate::CorruptionsFound, Value::Read32, "vm.vmtc_1_byte"},
    Row{"com.quill.kernel.vmtc_2_byte", Gate::CorruptionsFound, Value::Read32, "vm.vmtc_2_byte"},
    Row{"com.quill.kernel.vmtc_4_byte", Gate::CorruptionsFound, Value::Read32, "vm.vmtc_4_byte"},
    Row{"com.quill.kernel.vmtc_8_byte", Gate::CorruptionsFound, Value::Read32, "vm.vmtc_8_byte"},
    Row{"com.quill.kernel.vmtc_16_byte", Gate::CorruptionsFound, Value::Read32, "vm.vmtc_16_byte"},
    Row{"com.quill.kernel.vmtc_32_byte", Gate::CorruptionsFound, Value::Read32, "vm.vmtc_32_byte"},
    Row{"com.quill.kernel.vmtc_64_byte", Gate::CorruptionsFound, Value::Read32, "vm.vmtc_64_byte"},
    Row{"com.quill.kernel.vmtc_128_byte", Gate::CorruptionsFound, Value::Read32,
        "vm.vmtc_128_byte"},
    Row{"com.quill.kernel.vmtc_256_byte", Gate::CorruptionsFound, Value::Read32,
        "vm.vmtc_256_byte"},
    Row{"com.quill.kernel.vmtc_undiagnosed", Gate::CorruptionsFound, Value::Read32,
        "vm.vmtc_undiagnosed"},
    Row{"com.quill.kernel.memorystatus_freeze_count", Gate::Always, Value::Read32,
        "kern.memorystatus_freeze_count"},
    Row{"com.quill.kernel.memorystatus_freeze_pageouts", Gate::PageoutsRead, Value::GateNumber, ""},
    Row{"com.quill.memorystatus_freezer_thaws_per_gb", Gate::GibibytePagedOut, Value::PerGibibyte,
        "kern.memorystatus_thaw_count_since_boot"},
    Row{"com.quill.kernel.memorystatus_freeze_budget_pages_remaining", Gate::Always, Value::Read64,
        "kern.memorystatus_freeze_budget_pages_remaining"},
    Row{"com.quill.kernel.memorystatus_thaw_count", Gate::Always, Value::Read32,
        "kern.memorystatus_thaw_count"},
    Row{"com.quill.kernel.swapusage", Gate::Always, Value::SwapTotal, "vm.swapusage"},
    Row{"com.quill.memorystatus_freezer_error_no_compressor_space_count", Gate::ConsideredRead,
        Value::Percentage, "kern.memorystatus_freezer_error_no_compressor_space_count"},
    Row{"com.quill.memorystatus_freezer_error_no_swap_space_count", Gate::ConsideredRead,
        Value::Percentage, "kern.memorystatus_freezer_error_no_swap_space_count"},
    Row{"com.quill.memorystatus_freezer_error_below_min_pages_count", Gate::ConsideredRead,
        Value::Percentage, "kern.memorystatus_freezer_error_below_min_pages_count"},
    Row{"com.quill.memorystatus_freezer_error_low_probability_of_use_count", Gate::ConsideredRead,
        Value::Percentage, "kern.memorystatus_freezer_error_low_probability_of_use_count"},
    Row{"com.quill.memorystatus_freezer_error_other_count", Gate::ConsideredRead, Value::Percentage,
        "kern.memorystatus_freezer_error_other_count"},
    Row{"com.quill.memorystatus_freezer_process_considered_count", Gate::ConsideredRead,
        Value::GateNumber, ""},
    Row{"com.quill.memorystatus_freezer_skipped_full_count", Gate::BelowThresholdRead,
        Value::Percentage, "kern.memorystatus_freezer_skipped_full_count"},
    Row{"com.quill.memorystatus_freezer_thaw_percentage", Gate::Always, Value::Read64,
        "kern.memorystatus_freezer_thaw_percentage"},
    Row{"com.quill.memorystatus_freezer_refreeze_average", Gate::TenRefreezesCounted,
        Value::Quotient, "kern.memorystatus_freezer_bytes_refrozen"},
};
static_assert(kRows.size() == 28);

template <typename T>
std::optional<T> readVariable(const char* name) {
  std::array<std::uint8_t, sizeof(T)> bytes{};
  std::size_t length = 0;
  if (platform().kernel().sysctlbyname(name, bytes, length) != 0 || length != bytes.size()) {
    return std::nullopt;
  }
  T value;
  std::memcpy(&value, bytes.data(), sizeof value);
  return value;
}

std::uint64_t read64(const char* name) {
  return readVariable<std::uint64_t>(name).value_or(std::numeric_limits<std::uint64_t>::max());
}

double gibibytes(std::uint64_t bytes) { return static_cast<double>(bytes) * 0x1p-30; }

class Gates {
 public:
  /// The gate's number; nothing when it does not hold.
  std::optional<std::uint64_t> number(Gate gate) {
    auto& known = _numbers[static_cast<std::size_t>(gate)];
    if (!known) {
      known = read(gate);
    }
    return *known;
  }

 private:
  std::optional<std::uint64_t> read(Gate gate) {
    switch (gate) {
      case Gate::Always:
        break;
      case Gate::CorruptionsFound: {
        const std::optional<std::uint32_t> total = readVariable<std::uint32_t>("vm.vmtc_total");
        return total.value_or(0) != 0 ? std::optional<std::uint64_t>(*total) : std::nullopt;
      }
      case Gate::PageoutsRead:
        return readVariable<std::uint64_t>("kern.memorystatus_freeze_pageouts");
      case Gate::GibibytePagedOut: {
        const std::optional<std::uint64_t> pages = number(Gate::PageoutsRead);
        const std::uint64_t bytes = pages ? platform().kernel().pageSize() * *pages : 0;
        return gibibytes(bytes) >= 1.0 ? std::optional(bytes) : std::nullopt;
      }
      case Gate::ConsideredRead:
        return readVariable<std::uint64_t>("kern.memorystatus_freezer_process_considered_count");
      case Gate::BelowThresholdRead:
        return readVariable<std::uint64_t>("kern.memorystatus_freezer_below_threshold_count");
      case Gate::TenRefreezesCounted: {
        // All ones stands for a failed read, whoever made it.
        const std::uint64_t refreezes = read64("kern.memorystatus_freezer_refreeze_count");
        const bool holds =
            refreezes >= 10 && refreezes != std::numeric_limits<std::uint64_t>::max();
        return holds ? std::optional(refreezes) : std::nullopt;
      }
    }
    return 0;
  }

  std::array<std::optional<std::optional<std::uint64_t>>, kGateCount> _numbers;
};

std::int64_t valueOf(const Row& row, std::uint64_t gateNumber) {
  static_assert(std::numeric_limits<double>::is_iec559, "a division by 0 yields inf or NaN");
  const auto count = [&row] { return static_cast<double>(read64(row.variable)); };
  switch (row.value) {
    case Value::Read32:
      return readVariable<std::uint32_t>(row.variable)
          .value_or(std::numeric_limits<std::uint32_t>::max());
    case Value::Read64:
      return static_cast<std::int64_t>(read64(row.variable));
    case Value::SwapTotal: {
      const auto record = readVariable<std::array<std::uint64_t, 4>>(row.variable);
      return record ? static_cast<std::int64_t>(record->front()) : -1;
    }
    case Value::GateNumber:
      break;
    case Value::PerGibibyte:
      return saturatingTruncate(count() / gibibytes(gateNumber));
    case Value::Percentage:
      return saturatingTruncate(count() / static_cast<double>(gateNumber) * 100);
    case Value::Quotient:
      return static_cast<std::int64_t>(read64(row.variable) / gateNumber);
  }
  return static_cast<std::int64_t>(gateNumber);
}

}  // namespace

void TBReport::reportVMStats() {
  Gates gates;
  for (const Row& row : kRows) {
    if (const std::optional<std::uint64_t> number = gates.number(row.gate)) {
      addScalarForKeyByExecutingBlock(row.key, [&] { return valueOf(row, *number); });
    }
  }
}

}  // namespace vesprun
