#include "platform/host/outbox/LogName.h"

#include <algorithm>
#include <array>
#include <charconv>
#include <cstdio>

namespace vesprun {
namespace {

constexpr std::size_t kMinDigits = 4;
constexpr std::string_view kDailyLog = "193-log-aggregated";
constexpr std::array<std::string_view, 3> kEnds{".ptree", ".log", ".header.json"};

}  // namespace

std::optional<std::uint64_t> logNumber(std::string_view name) {
  std::uint64_t number = 0;
  const auto [rest, problem] = std::from_chars(name.data(), name.data() + name.size(), number);
  name.remove_prefix(static_cast<std::size_t>(rest - name.data()));
  return problem == std::errc() && name.starts_with('-') ? std::optional(number) : std::nullopt;
}

std::optional<LogName> LogName::parse(std::string_view text) {
  const std::optional<std::uint64_t> number = logNumber(text);
  const auto end =
      std::ranges::find_if(kEnds, [text](auto known) { return text.ends_with(known); });
  if (!number || end == kEnds.end()) {
    return std::nullopt;
  }
  text.remove_suffix(end->size());
  return LogName{std::string(text), *number, static_cast<End>(end - kEnds.begin())};
}

std::string LogName::text() const {
  return base + std::string(kEnds[static_cast<std::size_t>(end)]);
}

bool LogName::isDailyLog() const {
  return end == End::Ptree && kind() == kDailyLog && base.find('-') >= kMinDigits;
}

std::string logBase(std::uint64_t number, std::string_view type, std::string_view name) {
  char digits[24];
  std::snprintf(digits, sizeof digits, "%0*llu", static_cast<int>(kMinDigits),
                static_cast<unsigned long long>(number));
  return std::string(digits) + '-' + std::string(type) + '-' + std::string(name);
}

}  // namespace vesprun
