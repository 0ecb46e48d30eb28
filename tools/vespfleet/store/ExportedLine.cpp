#include "ExportedLine.h"

#include <nettle/sha2.h>
#include <simdjson.h>

#include <algorithm>
#include <cmath>
#include <limits>
#include <map>
#include <new>

#include "common/Calendar.h"
#include "platform/host/documents/JsonForm.h"
#include "platform/host/documents/NestedPlace.h"
#include "platform/host/documents/XmlText.h"

namespace vesprun {
namespace {

using Element = simdjson::dom::element;
using Object = simdjson::dom::object;
using Array = simdjson::dom::array;

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
T as(Element value, const char* why) {
  T found{};
  require(value.get(found) == simdjson::SUCCESS, why);
  return found;
}

Element entry(Object line, std::string_view name) {
  Element found;
  require(line.at_key(name).get(found) == simdjson::SUCCESS, "an entry is missing");
  return found;
}

std::string_view xmlText(std::string_view text) {
  require(isXmlText(text), "a text that XML cannot carry");
  return text;
}

std::string text(Element value, const char* why) {
  return std::string(xmlText(as<std::string_view>(value, why)));
}

constexpr std::size_t kMaxDevice = 255;
constexpr std::size_t kMaxKey = 1024;
constexpr std::size_t kMaxKeys = 20'000;
constexpr std::int32_t kMaxDay = 84'005;  // the end of 2199

std::string_view key(std::string_view name) {
  require(!name.empty(), "an empty key");
  require(name.size() <= kMaxKey, "a key of more than 1,024 bytes");
  return xmlText(name);
}

std::int64_t integer(Element value, std::int64_t least, std::int64_t greatest, const char* why) {
  const auto found = as<std::int64_t>(value, why);
  require(found >= least && found <= greatest, why);
  return found;
}

constexpr std::int64_t kMaxInt32 = std::numeric_limits<std::int32_t>::max();

/// What the element means where the JSON form has tagged objects, and no null.
PropertyValue withMeaning(Element element) {
  std::string ignored;
  std::optional<PropertyValue> value = valueFromJsonText(simdjson::minify(element), ignored);
  require(value.has_value(), "a null, or a number or date that no value can hold");
  return *std::move(value);
}

Date date(Element value) {
  std::string_view text;
  if (Object tagged; value.get(tagged) == simdjson::SUCCESS && tagged.size() == 1 &&
                     tagged.at_key("date").get(text) == simdjson::SUCCESS) {
    if (const std::optional<Date> found = parseDateText(text)) {
      return *found;
    }
  }
  const PropertyValue meaning = withMeaning(value);
  require(meaning.date() != nullptr, "a creation date that is not a date");
  return *meaning.date();
}

/// False for a distribution that counts as not there.
bool readStatistics(Element value, Statistics& statistics) {
  constexpr std::size_t kFigures = 4;
  constexpr const char* kWhyCount = "a count that is not from 0 to 2^31 - 1";
  double* const members[kFigures] = {&statistics.minimum, &statistics.maximum, &statistics.mean,
                                     &statistics.deviations};
  std::size_t read = 0;
  if (Array plain; value.get(plain) == simdjson::SUCCESS && plain.size() == kFigures + 1) {
    for (const Element number : plain) {
      if ((read < kFigures ? number.get(*members[read]) : number.get(statistics.count)) !=
          simdjson::SUCCESS) {
        break;
      }
      ++read;
    }
  }
  if (read <= kFigures) {  // one is tagged or wrong
    const PropertyValue meaning = withMeaning(value);
    const PropertyArray* const numbers = meaning.array();
    require(numbers != nullptr && numbers->size() == kFigures + 1 &&
                std::all_of(numbers->begin(), numbers->begin() + kFigures,
                            [](const PropertyValue& one) { return one.number() != nullptr; }),
            "a distribution that is not four doubles and a count");
    for (read = 0; read < kFigures; ++read) {
      *members[read] = (*numbers)[read].number()->asDouble();
    }
    const Number* const count = numbers->back().number();
    require(count != nullptr && !count->isFloatingPoint(), kWhyCount);
    statistics.count = count->asInt64();
  }
  require(statistics.count >= 0 && statistics.count <= kMaxInt32, kWhyCount);
  return statistics.count > 0 && std::all_of(members, members + kFigures, [](const double* figure) {
           return std::isfinite(*figure);
         });
}

Histogram readHistogram(Object counts) {
  Histogram histogram;
  for (const auto [label, value] : counts) {
    histogram.emplace(xmlText(label), integer(value, 0, INT64_MAX,
                                              "a bucket's count that is not from 0 to 2^63 - 1"));
  }
  return histogram;
}

std::optional<std::string> textOrNull(Element value, const char* why) {
  return value.is_null() ? std::nullopt : std::optional(text(value, why));
}

ExportedLine readLine(Object line, int version) {
  const std::size_t entries = version == 1 ? 9 : 11;
  require(integer(entry(line, "version"), INT64_MIN, INT64_MAX,
                  "a version that is not an integer") == version,
          "another version");
  ExportedLine read;
  read.device = text(entry(line, "device"), "a device that is not text");
  require(!read.device.empty(), "an empty device");
  require(read.device.size() <= kMaxDevice, "a device of more than 255 bytes");
  read.day = static_cast<std::int32_t>(
      integer(entry(line, "day"), 0, kMaxDay, "a day that is not from 1970 to 2199"));
  read.revision =
      integer(entry(line, "revision"), 1, kMaxInt32, "a revision that is not from 1 to 2^31 - 1");
  if (version != 1) {
    read.build = textOrNull(entry(line, "build"), "a build that is not text");
    read.model = textOrNull(entry(line, "model"), "a model that is not text");
  }
  read.created = date(entry(line, "created"));
  read.whitelist = text(entry(line, "whitelist"), "a whitelist digest that is not text");

  const auto scalars = as<Object>(entry(line, "scalars"), "scalars that are not an object");
  read.scalars.reserve(scalars.size());
  for (const auto [name, value] : scalars) {
    read.scalars.push_back(
        {std::string(key(name)),
         integer(value, INT64_MIN, INT64_MAX, "a scalar that is not a 64-bit integer")});
  }
  const auto distributions =
      as<Object>(entry(line, "distributions"), "distributions that are not an object");
  require(scalars.size() + distributions.size() <= kMaxKeys, "more than 20,000 keys");
  const auto histograms =
      as<Object>(entry(line, "histograms"), "histograms that are not an object");
  std::map<std::string_view, Histogram> histogramOf;
  for (const auto [name, value] : histograms) {
    histogramOf[key(name)] = readHistogram(as<Object>(value, "a histogram that is not an object"));
  }
  read.distributions.reserve(distributions.size());
  for (const auto [name, value] : distributions) {
    ReportedDistribution distribution{std::string(key(name)), {}};
    if (readStatistics(value, distribution.values.statistics)) {
      if (const auto found = histogramOf.find(name); found != histogramOf.end()) {
        distribution.values.histogram = std::move(found->second);
      }
      read.distributions.push_back(std::move(distribution));
    }
  }
  require(line.size() == entries, "an entry that does not belong there");
  return read;
}

/// Is a value nested too deeply, or a name twice in an object? `names` are those around the value.
bool isMalformed(Element value, std::size_t level, std::vector<std::string_view>& names) {
  Array array;
  Object object;
  const bool isArray = value.get(array) == simdjson::SUCCESS;
  if (!isArray && value.get(object) != simdjson::SUCCESS) {
    return false;
  }
  if (level == kMaxNestedLevels) {
    return true;
  }
  if (isArray) {
    return std::any_of(array.begin(), array.end(),
                       [&](Element element) { return isMalformed(element, level + 1, names); });
  }
  const auto own = static_cast<std::ptrdiff_t>(names.size());
  for (const auto [name, member] : object) {
    names.push_back(name);
    if (isMalformed(member, level + 1, names)) {
      return true;
    }
  }
  std::sort(names.begin() + own, names.end());
  const bool isTwice = std::adjacent_find(names.begin() + own, names.end()) != names.end();
  names.erase(names.begin() + own, names.end());
  return isTwice;
}

/// What the text says until the next call in this thread; nothing when it is malformed.
std::optional<Element> parsed(std::string_view text) {
  thread_local simdjson::dom::parser parser;
  constexpr std::string_view kByteOrderMark = "\xEF\xBB\xBF";
  text.remove_prefix(text.starts_with(kByteOrderMark) ? kByteOrderMark.size() : 0);
  Element root;
  const simdjson::error_code error = parser.parse(text.data(), text.size()).get(root);
  if (error == simdjson::MEMALLOC) {
    throw std::bad_alloc();
  }
  std::vector<std::string_view> names;
  const bool isTaken = error == simdjson::SUCCESS && !isMalformed(root, 0, names);
  return isTaken ? std::optional(root) : std::nullopt;
}

}  // namespace

LineDigest digestOf(std::string_view text) {
  static_assert(std::tuple_size_v<LineDigest> == SHA256_DIGEST_SIZE);
  sha256_ctx context;
  sha256_init(&context);
  sha256_update(&context, text.size(), reinterpret_cast<const std::uint8_t*>(text.data()));
  LineDigest digest{};
  sha256_digest(&context, digest.size(), digest.data());
  return digest;
}

std::optional<ExportedLine> parseExportedLine(std::string_view text, std::string& why,
                                              int version) {
  if (text.find_first_not_of(" \t\r") == std::string_view::npos) {
    why = "a blank line";
    return std::nullopt;
  }
  if (text.size() > kMaxExportedLine) {
    why = "longer than 16 MiB";
    return std::nullopt;
  }
  const std::optional<Element> root = parsed(text);
  if (!root) {
    why = "not JSON, or a name twice, or a number or text that no value can hold";
    return std::nullopt;
  }
  try {
    ExportedLine line = readLine(as<Object>(*root, "not an object"), version);
    line.digest = digestOf(text);
    line.size = text.size();
    return line;
  } catch (const Malformed& malformed) {
    why = malformed.why;
    return std::nullopt;
  }
}

}  // namespace vesprun
