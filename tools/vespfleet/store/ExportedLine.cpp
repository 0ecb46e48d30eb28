#include "ExportedLine.h"

#include <sha2.h>

#include <cmath>
#include <limits>
#include <map>

#include "platform/host/documents/JsonForm.h"
#include "platform/host/documents/XmlText.h"
#include "vesprun/PropertyDict.h"

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

constexpr std::size_t kMaxDevice = 255;
constexpr std::size_t kMaxKey = 1024;
constexpr std::size_t kMaxKeys = 20'000;
constexpr std::int32_t kMaxDay = 84'005;  // the end of 2199

std::string_view key(std::string_view name) {
  require(!name.empty(), "an empty key");
  require(name.size() <= kMaxKey, "a key of more than 1,024 bytes");
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

constexpr std::int64_t kMaxInt32 = std::numeric_limits<std::int32_t>::max();

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
  statistics.count = integer(numbers[4], 0, kMaxInt32, "a count that is not from 0 to 2^31 - 1");
  return finite && statistics.count > 0;
}

Histogram readHistogram(const PropertyDict& counts) {
  Histogram histogram;
  for (const auto& [label, value] : counts) {
    require(isXmlText(label), "a text that XML cannot carry");
    histogram[std::string(label)] = static_cast<std::uint64_t>(
        integer(value, 0, INT64_MAX, "a bucket's count that is not from 0 to 2^63 - 1"));
  }
  return histogram;
}

std::optional<std::string> textOrNull(const PropertyValue& value, const char* why) {
  if (const Bytes* null = value.data(); null != nullptr && null->empty()) {
    return std::nullopt;
  }
  return text(value, why);
}

/// The value of a plain one, which has no null.
PropertyValue withMeaning(const PropertyValue& plain) {
  std::string ignored;
  std::optional<PropertyValue> value = valueFromPlain(plain, ignored);
  require(value.has_value(), "a null, or a number or date that no value can hold");
  return *std::move(value);
}

ExportedLine readLine(PropertyDict line, int version) {
  const std::size_t entries = version == 1 ? 9 : 11;
  require(integer(entry(line, "version"), INT64_MIN, INT64_MAX, "a version that is no integer") ==
              version,
          "another version");
  ExportedLine read;
  read.device = text(entry(line, "device"), "a device that is no text");
  require(!read.device.empty(), "an empty device");
  require(read.device.size() <= kMaxDevice, "a device of more than 255 bytes");
  read.day = static_cast<std::int32_t>(
      integer(entry(line, "day"), 0, kMaxDay, "a day that is not from 1970 to 2199"));
  read.revision =
      integer(entry(line, "revision"), 1, kMaxInt32, "a revision that is not from 1 to 2^31 - 1");
  if (version != 1) {
    read.build = textOrNull(entry(line, "build"), "a build that is no text");
    read.model = textOrNull(entry(line, "model"), "a model that is no text");
  }
  const PropertyValue created = withMeaning(entry(line, "created"));
  read.created = as(created.date(), "a creation date that is none");
  read.whitelist = text(entry(line, "whitelist"), "a whitelist digest that is no text");

  const PropertyDict& scalars = as(entry(line, "scalars").dict(), "scalars that are no object");
  read.scalars.reserve(scalars.size());
  for (const auto& [name, value] : scalars) {
    read.scalars.push_back({std::string(key(name)), integer(value, INT64_MIN, INT64_MAX,
                                                            "a scalar that is no 64-bit integer")});
  }
  const PropertyDict& distributions =
      as(entry(line, "distributions").dict(), "distributions that are no object");
  require(scalars.size() + distributions.size() <= kMaxKeys, "more than 20,000 keys");
  const PropertyDict& histograms =
      as(entry(line, "histograms").dict(), "histograms that are no object");
  std::map<std::string_view, Histogram> histogramOf;
  for (const auto& [name, value] : histograms) {
    histogramOf[key(name)] = readHistogram(as(value.dict(), "a histogram that is no object"));
  }
  for (const auto& [name, value] : distributions) {
    ReportedDistribution distribution{std::string(key(name)), {}};
    if (readStatistics(withMeaning(value), distribution.values.statistics)) {
      if (const auto found = histogramOf.find(name); found != histogramOf.end()) {
        distribution.values.histogram = std::move(found->second);
      }
      read.distributions.push_back(std::move(distribution));
    }
  }
  require(line.size() == entries, "an entry that does not belong there");
  return read;
}

}  // namespace

LineDigest digestOf(std::string_view text) {
  static_assert(std::tuple_size_v<LineDigest> == SHA256_DIGEST_LENGTH);
  SHA2_CTX context;
  SHA256Init(&context);
  SHA256Update(&context, reinterpret_cast<const std::uint8_t*>(text.data()), text.size());
  LineDigest digest{};
  SHA256Final(digest.data(), &context);
  return digest;
}

std::optional<ExportedLine> parseExportedLine(std::string_view text, std::string& why,
                                              int version) {
  if (text.find_first_not_of(" \t\r") == std::string_view::npos) {
    why = "a blank line";
    return std::nullopt;
  }
  if (text.size() > kMaxLine) {
    why = "longer than 16 MiB";
    return std::nullopt;
  }
  std::string error;
  std::optional<PropertyValue> value = plainValueFromJsonText(text, error);
  if (!value) {
    // The error quotes the line, which may be another's secret.
    why = "not JSON, or a name twice, or a number or text that no value can hold";
    return std::nullopt;
  }
  try {
    require(std::as_const(*value).dict() != nullptr, "not an object");
    ExportedLine line = readLine(std::move(*value->dict()), version);
    line.digest = digestOf(text);
    line.size = text.size();
    return line;
  } catch (const Malformed& malformed) {
    why = malformed.why;
    return std::nullopt;
  }
}

}  // namespace vesprun
