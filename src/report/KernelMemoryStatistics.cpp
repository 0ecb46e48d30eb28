#include "report/KernelMemoryStatistics.h"

#include <array>
#include <cstring>
#include <iterator>
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

/// The number if it meets the condition, else nothing.
template <typename Condition>
std::optional<std::uint64_t> onlyIf(std::optional<std::uint64_t> number, Condition isMet) {
  return number && isMet(*number) ? number : std::nullopt;
}

/// Conditions of rows. Each is a number that the row's value may need; without it the row is left
/// out.
struct Gates {
  std::optional<std::uint64_t> always = 0;
  std::optional<std::uint64_t> corruptions =
      onlyIf(readVariable<std::uint32_t>("vm.vmtc_total"), [](auto total) { return total != 0; });
  std::optional<std::uint64_t> pageouts = read64("kern.memorystatus_freeze_pageouts");
  std::optional<std::uint64_t> bytesPagedOut =
      onlyIf(platform().kernel().pageSize() * pageouts.value_or(0),
             [](auto bytes) { return gibibytes(bytes) >= 1.0; });
  std::optional<std::uint64_t> considered =
      read64("kern.memorystatus_freezer_process_considered_count");
  std::optional<std::uint64_t> belowThreshold =
      read64("kern.memorystatus_freezer_below_threshold_count");
  std::optional<std::uint64_t> refreezes =
      onlyIf(read64("kern.memorystatus_freezer_refreeze_count"), [](auto count) {
        // All ones is a failed read.
        return count >= 10 && count != std::numeric_limits<std::uint64_t>::max();
      });
};

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
  std::optional<std::uint64_t> Gates::*gate;
  Value value;
  const char* variable;
};

using enum Value;
constexpr Row kRows[] = {
    {"com.quill.kernel.vmtc_total", &Gates::corruptions, Read32, "vm.vmtc_total"},
    {"com.quill.kernel.vmtc_one_bit_flip", &Gates::corruptions, Read32, "vm.vmtc_one_bit_flip"},
    {"com.quill.kernel.vmtc_not_found", &Gates::corruptions, Read32, "vm.vmtc_not_found"},
    {"com.quill.kernel.vmtc_1_byte", &Gates::corruptions, Read32, "vm.vmtc_1_byte"},
    {"com.quill.kernel.vmtc_2_byte", &Gates::corruptions, Read32, "vm.vmtc_2_byte"},
    {"com.quill.kernel.vmtc_4_byte", &Gates::corruptions, Read32, "vm.vmtc_4_byte"},
    {"com.quill.kernel.vmtc_8_byte", &Gates::corruptions, Read32, "vm.vmtc_8_byte"},
    {"com.quill.kernel.vmtc_16_byte", &Gates::corruptions, Read32, "vm.vmtc_16_byte"},
    {"com.quill.kernel.vmtc_32_byte", &Gates::corruptions, Read32, "vm.vmtc_32_byte"},
    {"com.quill.kernel.vmtc_64_byte", &Gates::corruptions, Read32, "vm.vmtc_64_byte"},
    {"com.quill.kernel.vmtc_128_byte", &Gates::corruptions, Read32, "vm.vmtc_128_byte"},
    {"com.quill.kernel.vmtc_256_byte", &Gates::corruptions, Read32, "vm.vmtc_256_byte"},
    {"com.quill.kernel.vmtc_undiagnosed", &Gates::corruptions, Read32, "vm.vmtc_undiagnosed"},
    {"com.quill.kernel.memorystatus_freeze_count", &Gates::always, Read32,
     "kern.memorystatus_freeze_count"},
    {"com.quill.kernel.memorystatus_freeze_pageouts", &Gates::pageouts, GateNumber, ""},
    {"com.quill.memorystatus_freezer_thaws_per_gb", &Gates::bytesPagedOut, PerGibibyte,
     "kern.memorystatus_thaw_count_since_boot"},
    {"com.quill.kernel.memorystatus_freeze_budget_pages_remaining", &Gates::always, Read64,
     "kern.memorystatus_freeze_budget_pages_remaining"},
    {"com.quill.kernel.memorystatus_thaw_count", &Gates::always, Read32,
     "kern.memorystatus_thaw_count"},
    {"com.quill.kernel.swapusage", &Gates::always, SwapTotal, "vm.swapusage"},
    {"com.quill.memorystatus_freezer_error_no_compressor_space_count", &Gates::considered,
     Percentage, "kern.memorystatus_freezer_error_no_compressor_space_count"},
    {"com.quill.memorystatus_freezer_error_no_swap_space_count", &Gates::considered, Percentage,
     "kern.memorystatus_freezer_error_no_swap_space_count"},
    {"com.quill.memorystatus_freezer_error_below_min_pages_count", &Gates::considered, Percentage,
     "kern.memorystatus_freezer_error_below_min_pages_count"},
    {"com.quill.memorystatus_freezer_error_low_probability_of_use_count", &Gates::considered,
     Percentage, "kern.memorystatus_freezer_error_low_probability_of_use_count"},
    {"com.quill.memorystatus_freezer_error_other_count", &Gates::considered, Percentage,
     "kern.memorystatus_freezer_error_other_count"},
    {"com.quill.memorystatus_freezer_process_considered_count", &Gates::considered, GateNumber, ""},
    {"com.quill.memorystatus_freezer_skipped_full_count", &Gates::belowThreshold, Percentage,
     "kern.memorystatus_freezer_skipped_full_count"},
    {"com.quill.memorystatus_freezer_thaw_percentage", &Gates::always, Read64,
     "kern.memorystatus_freezer_thaw_percentage"},
    {"com.quill.memorystatus_freezer_refreeze_average", &Gates::refreezes, Quotient,
     "kern.memorystatus_freezer_bytes_refrozen"},
};
static_assert(std::size(kRows) == 28);

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
  const Gates gates;
  for (const Row& row : kRows) {
    if (const std::optional<std::uint64_t>& number = gates.*row.gate) {
      report.addScalarForKeyByExecutingBlock(row.key, [&] { return valueOf(row, *number); });
    }
  }
}

}  // namespace vesprun
