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
constexpr std::size_t kMaxLineSize = 2 * 1024 * 1024;  // the longest key fits
constexpr std::size_t kMaxBufferedBytes = 32 * 1024 * 1024;

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
    if (_size > kMaxBufferedBytes) {
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

/// A line as it is read; the key refers to it.
struct CounterLine {
  bool isSample = false;
  std::int32_t day = 0;
  std::string_view key;
  std::int64_t value = 0;  ///< of a scalar
  Sample sample{};
};

bool parseLine(std::string_view text, CounterLine& line, std::string& error) {
  std::string_view kind;
  std::string_view dayText;
  std::string_view valueText;
  std::string_view offsetText;
  line.key = text;
  const bool hasKind = takeFirst(line.key, kind) && (kind == "scalar" || kind == "sample");
  line.isSample = kind == "sample";
  if (!hasKind || !takeFirst(line.key, dayText) ||
      (line.isSample && !takeLast(line.key, offsetText)) || !takeLast(line.key, valueText)) {
    error = quotedText(text) +
            " is neither scalar, DAY, KEY, VALUE nor sample, DAY, KEY, VALUE, "
            "OFFSET with tabs between";
    return false;
  }
  return parseField(dayText, "a day number", line.day, error) &&
         (line.isSample
              ? parseField(valueText, "a double", line.sample.value, error) &&
                    parseField(offsetText, "an offset in seconds", line.sample.secondsInDay, error)
              : parseField(valueText, "a signed 64-bit integer", line.value, error));
}

/// Gives each line to `take`, which may refuse it with a text in `error`.
template <typename Take>
bool forEachLine(std::istream& lines, std::string& error, const LineStep& step, const Take& take) {
  using Result = LineReader::Result;
  LineReader reader(lines, kMaxLineSize);
  const auto fail = [&](const std::string& cause) {
    error = "line " + std::to_string(reader.number()) + ": " + cause;
    return false;
  };
  std::string_view text;
  std::string cause;
  CounterLine line;
  Result result{};
  while ((result = reader.next(text)) == Result::Line) {
    if (!parseLine(text, line, cause) || !take(line, cause)) {
      return fail(cause);
    }
    if (step) {
      step(text);
    }
  }
  if (result != Result::End) {
    return fail(result == Result::TooLong ? "longer than 2 MiB" : std::strerror(errno));
  }
  return true;
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

std::optional<std::set<std::int32_t>> checkCounterLines(std::istream& lines, std::string& error,
                                                        const LineStep& step) {
  std::set<std::int32_t> days;
  std::optional<std::int32_t> last;
  const auto check = [&](const CounterLine& line, std::string& cause) {
    if (last != line.day) {
      days.insert(*(last = line.day));
    }
    return isCounterKey(line.key, cause);
  };
  return forEachLine(lines, error, step, check) ? std::optional(std::move(days)) : std::nullopt;
}

bool importCounterLines(std::istream& lines, CounterStore& counters, std::string& error,
                        const LineStep& step) {
  SampleBuffer samples(counters);
  const auto take = [&](const CounterLine& line, std::string& cause) {
    if (line.isSample) {
      return samples.add(line.day, line.key, line.sample, cause);
    }
    const bool isKey = isCounterKey(line.key, cause);
    if (isKey) {
      counters.setScalar(line.day, line.key, line.value);
    }
    return isKey;
  };
  if (!forEachLine(lines, error, step, take)) {
    return false;
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
