#include "ExportedLine.h"

#include <cmath>
#include <limits>

#include "common/PropertyDict.h"
#include "platform/host/documents/JsonForm.h"
#include "platform/host/documents/XmlText.h"

namespace vesprun {
namespace {

/// Why a line is malformed; caught in `parseExportedLine`.
struct Malformed {
  const char* why;
};

void require(bool condition, const char* why) {
  if (!condition) {
    throw Malformed{why};
  }
}

template <typename T>
const T& as(const T* value, const char* why) {
  require(value != nullptr, why);
  return *value;
}

const PropertyValue& entry(const PropertyDict& line, std::string_view name) {
  return as(line.find(name), "an entry is missing");
}

const std::string& text(const PropertyValue& value, const char* why) {
  const std::string& found = as(value.string(), why);
  require(isXmlText(found), "a text that XML cannot carry");
  return found;
}

std::string_view key(std::string_view name) {
  require(!name.empty(), "an empty key");
  require(isXmlText(name), "a text that XML cannot carry");
  return name;
}

std::int64_t integer(const PropertyValue& value, std::int64_t least, std::int64_t greatest,
                     const char* why) {
  const Number& number = as(value.number(), why);
  require(!number.isFloatingPoint() &&
              (number.isSigned() || number.asUInt64() <= std::uint64_t{INT64_MAX}),
          why);
  const std::int64_t found = number.asInt64();
  require(found >= least && found <= greatest, why);
  return found;
}

std::int64_t count(const PropertyValue& value) {
  return integer(value, 0, std::numeric_limits<std::int32_t>::max(), "a count that is none");
}

/// False for a distribution that counts as not there.
bool readStatistics(const PropertyValue& value, Statistics& statistics) {
  constexpr const char* kWhy = "a distribution that is not four doubles and a count";
  const PropertyArray& numbers = as(value.array(), kWhy);
  require(numbers.size() == 5, kWhy);
  double* const members[] = {&statistics.minimum, &statistics.maximum, &statistics.mean,
                             &statistics.deviations};
  bool finite = true;
  for (std::size_t i = 0; i < 4; ++i) {
    *members[i] = as(numbers[i].number(), kWhy).asDouble();
    finite = finite && std::isfinite(*members[i]);
  }
  statistics.count = count(numbers[4]);
  return finite && statistics.count > 0;
}

Histogram readHistogram(const PropertyDict& counts) {
  Histogram histogram;
  for (const auto& [label, value] : counts) {
    require(isXmlText(label), "a text that XML cannot carry");
    histogram[std::string(label)] = static_cast<std::uint64_t>(count(value));
  }
  return histogram;
}

ExportedLine readLine(const PropertyDict& line) {
  constexpr std::size_t kEntries = 9;
  require(
      integer(entry(line, "version"), INT64_MIN, INT64_MAX, "a version that is no integer") == 1,
      "another version");
  ExportedLine read;
  read.device = text(entry(line, "device"), "a device that is no text");
  require(!read.device.empty(), "an empty device");
  read.day = static_cast<std::int32_t>(
      integer(entry(line, "day"), INT32_MIN, INT32_MAX, "a day that is no 32-bit integer"));
  read.revision = integer(entry(line, "revision"), 1, INT64_MAX, "a revision that is none");
  read.created = as(entry(line, "created").date(), "a creation date that is none");
  text(entry(line, "whitelist"), "a whitelist digest that is no text");

  const PropertyDict& scalars = as(entry(line, "scalars").dict(), "scalars that are no object");
  read.scalars.reserve(scalars.size());
  for (const auto& [name, value] : scalars) {
    read.scalars.push_back({std::string(key(name)), integer(value, INT64_MIN, INT64_MAX,
                                                            "a scalar that is no 64-bit integer")});
  }
  const PropertyDict& distributions =
      as(entry(line, "distributions").dict(), "distributions that are no object");
  const PropertyDict& histograms =
      as(entry(line, "histograms").dict(), "histograms that are no object");
  std::map<std::string_view, Histogram> histogramOf;
  for (const auto& [name, value] : histograms) {
    histogramOf[key(name)] = readHistogram(as(value.dict(), "a histogram that is no object"));
  }
  for (const auto& [name, value] : distributions) {
    ReportedDistribution distribution{std::string(key(name)), {}};
    if (readStatistics(value, distribution.values.statistics)) {
      if (const auto found = histogramOf.find(name); found != histogramOf.end()) {
        distribution.values.histogram = std::move(found->second);
      }
      read.distributions.push_back(std::move(distribution));
    }
  }
  require(line.size() == kEntries, "an entry that does not belong there");
  return read;
}

}  // namespace

std::optional<ExportedLine> parseExportedLine(std::string_view text, std::string& why) {
  if (text.find_first_not_of(" \t\r") == std::string_view::npos) {
    why = "a blank line";
    return std::nullopt;
  }
  std::string error;
  const std::optional<PropertyValue> value = valueFromJsonText(text, error);
  if (!value) {
    // The error quotes the line, which may be another's secret.
    why = "not JSON, or a name twice, or a number or text that no value can hold";
    return std::nullopt;
  }
  try {
    ExportedLine line = readLine(as(value->dict(), "not an object"));
    line.text = text;
    return line;
  } catch (const Malformed& malformed) {
    why = malformed.why;
    return std::nullopt;
  }
}

}  // namespace vesprun
