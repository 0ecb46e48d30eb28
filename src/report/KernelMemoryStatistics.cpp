#include "report/KernelMemoryStatistics.h"

#include <array>
#include <cstring>
#include <limits>

#include "platform/Platform.h"

namespace vesprun {
namespace {

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

std::optional<std::uint64_t> read64(const char* name) { return readVariable<std::uint64_t>(name); }

std::uint64_t read64OrAllOnes(const char* name) {
  return read64(name).value_or(std::numeric_limits<std::uint64_t>::max());
}

double gibibytes(std::uint64_t bytes) { return static_cast<double>(bytes) * 0x1p-30; }

using Number64 = std::optional<std::uint64_t>;

/// The condition of neighbouring rows: a number that their values may need; without it they are
/// left out. It is evaluated once, when the first of them is due, and knows the number of the
/// condition before it.
using Gate = Number64 (*)(const Number64& before);

Number64 always(const Number64& /*before*/) { return 0; }

Number64 corruptions(const Number64& /*before*/) {
  const auto total = readVariable<std::uint32_t>("vm.vmtc_total");
  return total && *total != 0 ? Number64(*total) : std::nullopt;
}

Number64 pageouts(const Number64& /*before*/) {
  return read64("kern.memorystatus_freeze_pageouts");
}

Number64 bytesPagedOut(const Number64& pageouts) {
  const std::uint64_t bytes = pageouts ? platform().kernel().pageSize() * *pageouts : 0;
  return gibibytes(bytes) >= 1.0 ? Number64(bytes) : std::nullopt;
}

Number64 considered(const Number64& /*before*/) {
  return read64("kern.memorystatus_freezer_process_considered_count");
}

Number64 belowThreshold(const Number64& /*before*/) {
  return read64("kern.memorystatus_freezer_below_threshold_count");
}

Number64 refreezes(const Number64& /*before*/) {
  const Number64 count = read64("kern.memorystatus_freezer_refreeze_count");
  // All ones is a failed read.
  return count && *count >= 10 && *count != std::numeric_limits<std::uint64_t>::max()
             ? count
             : std::nullopt;
}

/// How a row's value is made from its variable and its gate's number.
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

using enum Value;
constexpr Row kRows[] = {
    {"com.quill.kernel.vmtc_total", corruptions, Read32, "vm.vmtc_total"},
    {"com.quill.kernel.vmtc_one_bit_flip", corruptions, Read32, "vm.vmtc_one_bit_flip"},
    {"com.quill.kernel.vmtc_not_found", corruptions, Read32, "vm.vmtc_not_found"},
    {"com.quill.kernel.vmtc_1_byte", corruptions, Read32, "vm.vmtc_1_byte"},
    {"com.quill.kernel.vmtc_2_byte", corruptions, Read32, "vm.vmtc_2_byte"},
    {"com.quill.kernel.vmtc_4_byte", corruptions, Read32, "vm.vmtc_4_byte"},
    {"com.quill.kernel.vmtc_8_byte", corruptions, Read32, "vm.vmtc_8_byte"},
    {"com.quill.kernel.vmtc_16_byte", corruptions, Read32, "vm.vmtc_16_byte"},
    {"com.quill.kernel.vmtc_32_byte", corruptions, Read32, "vm.vmtc_32_byte"},
    {"com.quill.kernel.vmtc_64_byte", corruptions, Read32, "vm.vmtc_64_byte"},
    {"com.quill.kernel.vmtc_128_byte", corruptions, Read32, "vm.vmtc_128_byte"},
    {"com.quill.kernel.vmtc_256_byte", corruptions, Read32, "vm.vmtc_256_byte"},
    {"com.quill.kernel.vmtc_undiagnosed", corruptions, Read32, "vm.vmtc_undiagnosed"},
    {"com.quill.kernel.memorystatus_freeze_count", always, Read32,
     "kern.memorystatus_freeze_count"},
    {"com.quill.kernel.memorystatus_freeze_pageouts", pageouts, GateNumber, ""},
    {"com.quill.memorystatus_freezer_thaws_per_gb", bytesPagedOut, PerGibibyte,
     "kern.memorystatus_thaw_count_since_boot"},
    {"com.quill.kernel.memorystatus_freeze_budget_pages_remaining", always, Read64,
     "kern.memorystatus_freeze_budget_pages_remaining"},
    {"com.quill.kernel.memorystatus_thaw_count", always, Read32, "kern.memorystatus_thaw_count"},
    {"com.quill.kernel.swapusage", always, SwapTotal, "vm.swapusage"},
    {"com.quill.memorystatus_freezer_error_no_compressor_space_count", considered, Percentage,
     "kern.memorystatus_freezer_error_no_compressor_space_count"},
    {"com.quill.memorystatus_freezer_error_no_swap_space_count", considered, Percentage,
     "kern.memorystatus_freezer_error_no_swap_space_count"},
    {"com.quill.memorystatus_freezer_error_below_min_pages_count", considered, Percentage,
     "kern.memorystatus_freezer_error_below_min_pages_count"},
    {"com.quill.memorystatus_freezer_error_low_probability_of_use_count", considered, Percentage,
     "kern.memorystatus_freezer_error_low_probability_of_use_count"},
    {"com.quill.memorystatus_freezer_error_other_count", considered, Percentage,
     "kern.memorystatus_freezer_error_other_count"},
    {"com.quill.memorystatus_freezer_process_considered_count", considered, GateNumber, ""},
    {"com.quill.memorystatus_freezer_skipped_full_count", belowThreshold, Percentage,
     "kern.memorystatus_freezer_skipped_full_count"},
    {"com.quill.memorystatus_freezer_thaw_percentage", always, Read64,
     "kern.memorystatus_freezer_thaw_percentage"},
    {"com.quill.memorystatus_freezer_refreeze_average", refreezes, Quotient,
     "kern.memorystatus_freezer_bytes_refrozen"},
};

std::int64_t valueOf(const Row& row, std::uint64_t gateNumber) {
  static_assert(std::numeric_limits<double>::is_iec559, "a division by 0 yields inf or NaN");
  const auto count = [&row] { return static_cast<double>(read64OrAllOnes(row.variable)); };
  switch (row.value) {
    case Value::Read32:
      return readVariable<std::uint32_t>(row.variable)
          .value_or(std::numeric_limits<std::uint32_t>::max());
    case Value::Read64:
      return static_cast<std::int64_t>(read64OrAllOnes(row.variable));
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
      return static_cast<std::int64_t>(read64OrAllOnes(row.variable) / gateNumber);
  }
  return static_cast<std::int64_t>(gateNumber);
}

}  // namespace

std::vector<std::string_view> vmStatisticKeys() {
  std::vector<std::string_view> keys;
  for (const Row& row : kRows) {
    keys.emplace_back(row.key);
  }
  return keys;
}

void reportVMStats(TBReport& report) {
  Gate gate = nullptr;
  Number64 number;
  for (const Row& row : kRows) {
    if (row.gate != gate) {
      gate = row.gate;
      number = gate(number);
    }
    if (number) {
      report.addScalarForKeyByExecutingBlock(row.key, [&] { return valueOf(row, *number); });
    }
  }
}

}  // namespace vesprun
