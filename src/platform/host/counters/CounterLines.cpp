#include "platform/host/counters/CounterLines.h"

#include <cerrno>
#include <cmath>
#include <cstring>
#include <map>
#include <optional>
#include <utility>
#include <vector>

#include "platform/host/documents/NumberText.h"
#include "platform/host/documents/QuotedText.h"
#include "platform/host/files/LineReader.h"

namespace vesprun {
namespace {

constexpr std::size_t kWrittenPiece = 256 * 1024;
constexpr std::size_t kLongestLine = 2 * 1024 * 1024;  // the longest key fits
constexpr std::size_t kMostBufferedBytes = 32 * 1024 * 1024;

/// Collects samples by key, so that alternating keys reach the tables as runs.
class SampleBuffer {
 public:
  explicit SampleBuffer(CounterStore& counters) : _counters(counters) {}

  bool add(std::int32_t day, std::string_view key, Sample sample, std::string& error) {
    constexpr std::size_t kEntrySize = 128;  // about what a node costs beside its key and samples
    if (_current == _samples.end() || _current->first.first != day ||
        _current->first.second != key) {
      if (!isCounterKey(key, error)) {
        return false;
      }
      const auto [entry, isNew] = _samples.try_emplace({day, std::string(key)});
      _current = entry;
      _size += isNew ? kEntrySize + key.size() : 0;
    }
    _current->second.push_back(sample);
    _size += sizeof sample;
    if (_size > kMostBufferedBytes) {
      flush();
    }
    return true;
  }

  void flush() {
    for (const auto& [place, samples] : _samples) {
      _counters.appendSamples(place.first, place.second, samples);
    }
    _samples.clear();
    _current = _samples.end();
    _size = 0;
  }

 private:
  using Samples = std::map<std::pair<std::int32_t, std::string>, std::vector<Sample>>;

  CounterStore& _counters;
  Samples _samples;
  Samples::iterator _current = _samples.end();
  std::size_t _size = 0;
};

/// False without a tab.
bool takeFirst(std::string_view& text, std::string_view& field) {
  const auto tab = text.find('\t');
  if (tab == std::string_view::npos) {
    return false;
  }
  field = text.substr(0, tab);
  text.remove_prefix(tab + 1);
  return true;
}

bool takeLast(std::string_view& text, std::string_view& field) {
  const auto tab = text.rfind('\t');
  if (tab == std::string_view::npos) {
    return false;
  }
  field = text.substr(tab + 1);
  text.remove_suffix(text.size() - tab);
  return true;
}

template <typename T>
bool parseField(std::string_view field, const char* what, T& value, std::string& error) {
  if (parseWholeText(field, value)) {
    return true;
  }
  error = quotedText(field) + " is not " + what;
  return false;
}

bool importLine(std::string_view line, CounterStore& counters, SampleBuffer& samples,
                std::string& error) {
  std::string_view kind;
  std::string_view dayText;
  std::string_view valueText;
  std::string_view offsetText;
  std::string_view key = line;
  const bool hasKind = takeFirst(key, kind) && (kind == "scalar" || kind == "sample");
  const bool isSample = kind == "sample";
  if (!hasKind || !takeFirst(key, dayText) || (isSample && !takeLast(key, offsetText)) ||
      !takeLast(key, valueText)) {
    error = quotedText(line) +
            " is neither scalar, DAY, KEY, VALUE nor sample, DAY, KEY, VALUE, "
            "OFFSET with tabs between";
    return false;
  }
  std::int32_t day = 0;
  if (!parseField(dayText, "a day number", day, error)) {
    return false;
  }
  if (!isSample) {
    std::int64_t value = 0;
    if (!parseField(valueText, "a signed 64-bit integer", value, error) ||
        !isCounterKey(key, error)) {
      return false;
    }
    counters.setScalar(day, key, value);
    return true;
  }
  Sample sample{};
  return parseField(valueText, "a double", sample.value, error) &&
         parseField(offsetText, "an offset in seconds", sample.secondsInDay, error) &&
         samples.add(day, key, sample, error);
}

/// Writes lines in pieces.
class LineWriter {
 public:
  explicit LineWriter(const std::function<bool(std::string_view)>& sink) : _sink(sink) {}

  bool isOpen() const { return _open; }

  void scalar(std::int32_t day, std::string_view key, std::int64_t value) {
    begin("scalar", day, key);
    number(value);
    end();
  }

  void sample(std::int32_t day, std::string_view key, double value, std::int32_t offset) {
    begin("sample", day, key);
    if (std::isnan(value)) {
      _text += "nan";  // whatever its sign
    } else {
      number(value);
    }
    _text += '\t';
    number(offset);
    end();
  }

  void flush() {
    _open = _open && (_text.empty() || _sink(_text));
    _text.clear();
  }

 private:
  void begin(const char* kind, std::int32_t day, std::string_view key) {
    _text += kind;
    _text += '\t';
    number(day);
    _text += '\t';
    _text += key;
    _text += '\t';
  }

  template <typename T>
  void number(T value) {
    char digits[32];  // the longest double takes 24
    const auto result = std::to_chars(digits, digits + sizeof digits, value);
    _text.append(digits, result.ptr);
  }

  void end() {
    _text += '\n';
    if (_text.size() >= kWrittenPiece) {
      flush();
    }
  }

  const std::function<bool(std::string_view)>& _sink;
  std::string _text;
  bool _open = true;
};

}  // namespace

bool importCounterLines(std::istream& lines, CounterStore& counters, std::string& error) {
  using Result = LineReader::Result;
  LineReader reader(lines, kLongestLine);
  SampleBuffer samples(counters);
  const auto fail = [&](const std::string& cause) {
    error = "line " + std::to_string(reader.number()) + ": " + cause;
    return false;
  };
  std::string_view line;
  std::string cause;
  Result result{};
  while ((result = reader.next(line)) == Result::Line) {
    if (!importLine(line, counters, samples, cause)) {
      return fail(cause);
    }
  }
  if (result != Result::End) {
    return fail(result == Result::TooLong ? "longer than 2 MiB" : std::strerror(errno));
  }
  samples.flush();
  return true;
}

bool exportCounterLines(CounterStore& counters, std::int32_t firstDay, std::int32_t lastDay,
                        const std::function<bool(std::string_view)>& sink, std::string& error) {
  LineWriter writer(sink);
  std::uint64_t leftOut = 0;
  const auto canBeWritten = [&](std::string_view key) {
    const bool good = key.find('\n') == std::string_view::npos;
    if (!good && leftOut++ == 0) {
      error = quotedText(key);
    }
    return good;
  };
  std::optional<std::int32_t> day = counters.nextDay(std::int64_t{firstDay} - 1);
  for (; writer.isOpen() && day && *day <= lastDay; day = counters.nextDay(*day)) {
    counters.readScalars(
        "", *day, *day,
        [&](std::string_view key, std::int32_t rowDay, std::int64_t value, bool& stop) {
          if (canBeWritten(key)) {
            writer.scalar(rowDay, key, value);
          }
          stop = !writer.isOpen();
        });
    counters.readDistributions(
        "", *day, *day,
        [&](std::string_view key, std::int32_t rowDay, TBHistoryDistributionEnumerator& values,
            bool& stop) {
          double value = 0;
          std::int32_t offset = 0;
          const bool good = canBeWritten(key);
          while (good && writer.isOpen() && values.getNextValueSecondsInDayOffset(value, &offset)) {
            writer.sample(rowDay, key, value, offset);
          }
          stop = !writer.isOpen();
        });
  }
  writer.flush();
  if (leftOut != 0) {
    error = std::to_string(leftOut) + " counters, the first of them " + error +
            ", are left out: no line can carry a line feed in a key";
  }
  return leftOut == 0;
}

}  // namespace vesprun
