#include "outbox/DailyLogView.h"

#include <algorithm>
#include <cmath>
#include <cstdio>
#include <iomanip>
#include <string>

#include "common/Calendar.h"
#include "common/TextForm.h"
#include "platform/host/documents/QuotedText.h"

namespace vesprun {
namespace {

const PropertyDict kEmpty;

const PropertyDict& section(const PropertyDict& log, const char* key) {
  const PropertyDict* value = log.findDict(key);
  return value != nullptr ? *value : kEmpty;
}

std::string text(const PropertyDict& log, const char* key) {
  const PropertyValue* value = log.find(key);
  if (value == nullptr) {
    return "(absent)";
  }
  return value->date() != nullptr ? dateText(*value->date()) : printableText(textForm(*value));
}

std::size_t longestKey(const PropertyDict& dict) {
  std::size_t longest = 0;
  for (const auto& entry : dict) {
    longest = std::max(longest, printableText(entry.first).size());
  }
  return longest;
}

void showEntries(std::ostream& out, const char* title, const PropertyDict& entries) {
  out << "\n  " << title << " (" << entries.size() << ")\n";
  const auto width = static_cast<int>(longestKey(entries));
  for (const auto& [key, value] : entries) {
    out << "    " << std::left << std::setw(width) << printableText(key) << "  "
        << printableText(textForm(value)) << '\n';
  }
}

std::string rounded(double value) {
  char digits[64];
  std::snprintf(digits, sizeof digits, "%.6g", value);
  return digits;
}

double figure(const PropertyArray& statistics, std::size_t index) {
  const Number* number = index < statistics.size() ? statistics[index].number() : nullptr;
  return number != nullptr ? number->asDouble() : std::nan("");
}

void showHistogram(std::ostream& out, const PropertyDict& histogram) {
  constexpr double kMaxBarWidth = 40;
  double largest = 0;
  for (const auto& [label, count] : histogram) {
    largest = std::max(largest, count.number() != nullptr ? count.number()->asDouble() : 0.0);
  }
  const auto width = static_cast<int>(longestKey(histogram));
  for (const auto& [label, count] : histogram) {
    const double value = count.number() != nullptr ? count.number()->asDouble() : 0.0;
    // The counts of an untrusted log may be anything.
    const double share = value > 0 ? value / largest : 0.0;
    const auto length = share <= 1 ? static_cast<std::size_t>(std::ceil(share * kMaxBarWidth)) : 0;
    out << "      " << std::right << std::setw(width) << printableText(label) << "  "
        << std::string(length, '#') << ' ' << printableText(textForm(count)) << '\n';
  }
}

void showDistributions(std::ostream& out, const PropertyDict& distributions,
                       const PropertyDict& histograms) {
  out << "\n  Distributions (" << distributions.size() << ")\n";
  for (const auto& [key, value] : distributions) {
    if (value.array() == nullptr) {
      continue;
    }
    const PropertyArray& statistics = *value.array();
    const double count = figure(statistics, 4);
    out << "    " << printableText(key) << "\n      count " << rounded(count) << ", min "
        << rounded(figure(statistics, 0)) << ", mean " << rounded(figure(statistics, 2)) << ", max "
        << rounded(figure(statistics, 1)) << ", standard deviation "
        << rounded(count > 0 ? std::sqrt(figure(statistics, 3) / count) : 0.0) << '\n';
    showHistogram(out, section(histograms, key.c_str()));
  }
}

}  // namespace

void showDailyLog(std::ostream& out, const PropertyDict& log) {
  out << "  day        " << text(log, "TBStartDate") << "\n  created    "
      << text(log, "TBLogCreationDate") << "\n  whitelist  " << text(log, "TBWhitelistDigest")
      << "\n  tasking    " << text(log, "TBTaskID") << ", " << text(log, "TBTaskDigest") << '\n';
  if (const PropertyValue* apps = log.find("TBActivatedAppInfo")) {
    out << "  apps       " << printableText(textForm(*apps)) << '\n';
  }
  showEntries(out, "Metadata", section(log, "TBMetadata"));
  showEntries(out, "Scalars", section(log, "TBScalars"));
  showDistributions(out, section(log, "TBDistributions"), section(log, "TBDistributionsHistogram"));
}

}  // namespace vesprun
