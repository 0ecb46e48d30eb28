#include "export/Metrics.h"

#include <cmath>
#include <limits>
#include <map>
#include <optional>

#include "common/TextForm.h"
#include "platform/host/documents/NumberText.h"

namespace vesprun {
namespace {

std::string metricNumber(double value) {
  return std::isnan(value)   ? "NaN"
         : std::isinf(value) ? (value > 0 ? "+Inf" : "-Inf")
                             : textForm(Number(value));
}

std::string labelText(std::string_view text) {
  std::string escaped;
  for (const char c : text) {
    if (c == '\n') {
      escaped += "\\n";
    } else {
      escaped.append(c == '"' || c == '\\' ? 1 : 0, '\\') += c;
    }
  }
  return escaped;
}

void beginFamily(std::string& text, std::string_view name, std::string_view type,
                 std::string_view help) {
  text.append("# HELP ").append(name).append(" ").append(help).append("\n# TYPE ");
  text.append(name).append(" ").append(type) += '\n';
}

void addSample(std::string& text, std::string_view name, std::string_view labels,
               std::string_view value) {
  text.append(name);
  if (!labels.empty()) {
    text.append("{").append(labels).append("}");
  }
  text.append(" ").append(value) += '\n';
}

/// The number after the comma of "(10, 100]".
std::optional<double> upperBound(std::string_view label) {
  const std::size_t comma = label.rfind(", ");
  double bound = 0;
  if (comma == std::string_view::npos || label.size() < comma + 4 ||
      !parseWholeText(label.substr(comma + 2, label.size() - comma - 3), bound) ||
      std::isnan(bound)) {
    return std::nullopt;
  }
  return bound;
}

/// Counts by upper bound, whatever order the labels have. Nothing when one has no bound.
std::optional<std::map<double, std::uint64_t>> bucketsOf(const PropertyDict* histogram) {
  if (histogram == nullptr) {
    return std::nullopt;
  }
  std::map<double, std::uint64_t> buckets{{std::numeric_limits<double>::infinity(), 0}};
  for (const auto& [label, count] : *histogram) {
    const std::optional<double> bound = upperBound(label);
    if (!bound || count.number() == nullptr) {
      return std::nullopt;
    }
    buckets[*bound] += count.number()->asUInt64();
  }
  return buckets;
}

}  // namespace

std::string metricsText(std::int32_t day, const PropertyDict& document) {
  std::string text;
  beginFamily(text, "vesprun_report_day", "gauge", "Day of the newest daily log, since 1970.");
  addSample(text, "vesprun_report_day", "", std::to_string(day));
  if (const Date* const created = document.findDate("TBLogCreationDate")) {
    beginFamily(text, "vesprun_report_created_seconds", "gauge",
                "When the newest daily log was made, in seconds since 1970.");
    addSample(text, "vesprun_report_created_seconds", "",
              metricNumber(static_cast<double>(created->seconds) + created->nanoseconds / 1e9));
  }
  if (const PropertyDict* const scalars = document.findDict("TBScalars");
      scalars != nullptr && !scalars->empty()) {
    beginFamily(text, "vesprun_scalar", "gauge", "Scalars of the newest daily log, as reported.");
    for (const auto& [key, value] : *scalars) {
      addSample(text, "vesprun_scalar", "key=\"" + labelText(key) + '"',
                std::to_string(value.number()->asInt64()));
    }
  }
  std::string histograms;
  std::string summaries;
  const PropertyDict* const all = document.findDict("TBDistributionsHistogram");
  for (const auto& [key, statistics] : *document.findDict("TBDistributions")) {
    const PropertyArray& figures = *statistics.array();
    const std::int64_t count = figures[4].number()->asInt64();
    if (count == 0) {
      continue;
    }
    const double sum = figures[2].number()->asDouble() * static_cast<double>(count);
    const std::string label = "key=\"" + labelText(key) + '"';
    const auto buckets = bucketsOf(all == nullptr ? nullptr : all->findDict(key));
    std::string& family = buckets ? histograms : summaries;
    const std::string name = buckets ? "vesprun_distribution" : "vesprun_distribution_plain";
    std::uint64_t below = 0;
    if (buckets) {
      for (const auto& [bound, more] : *buckets) {
        below += more;
        addSample(family, name + "_bucket", label + ",le=\"" + metricNumber(bound) + '"',
                  std::to_string(below));
      }
    }
    addSample(family, name + "_sum", label, metricNumber(sum));
    addSample(family, name + "_count", label, std::to_string(count));
  }
  if (!histograms.empty()) {
    beginFamily(text, "vesprun_distribution", "histogram",
                "Distributions of the newest daily log that have a histogram.");
    text += histograms;
  }
  if (!summaries.empty()) {
    beginFamily(text, "vesprun_distribution_plain", "summary",
                "Distributions of the newest daily log without a histogram.");
    text += summaries;
  }
  return text;
}

}  // namespace vesprun
