#include "platform/host/figures/Collection.h"

#include <algorithm>
#include <map>
#include <optional>
#include <utility>

#include "platform/host/figures/FigureReader.h"

namespace vesprun {
namespace {

// Vanished devices are remembered, since they may come back; but names must not pile up.
constexpr std::size_t kMaxMarks = 8192;

/// What is remembered of a figure, of a file that was left out, or of the boot.
struct Mark {
  std::int64_t device = 0;
  std::int64_t value = 0;  ///< of the boot: when the collection was, in seconds since 1970
  std::string text{};      ///< why a file was left out; the boot's identifier
};

constexpr const char* kBootPlace = "boot";

using Marks = std::map<std::string, Mark>;

Marks readMarks(const SqliteConnection& connection) {
  SqliteStatement rows(connection, "SELECT place, device, value, text FROM mark");
  Marks marks;
  while (rows.step()) {
    marks[std::string(rows.text(0))] = {rows.integer(1), rows.integer(2),
                                        std::string(rows.text(3))};
  }
  return marks;
}

void writeMarks(const SqliteConnection& connection, const Marks& marks) {
  SqliteStatement(connection, "DELETE FROM mark").run();
  SqliteStatement put(connection,
                      "INSERT INTO mark (place, device, value, text) VALUES (?, ?, ?, ?)");
  for (const auto& [place, mark] : marks) {
    put.bind(1, std::string_view(place)).bind(2, mark.device).bind(3, mark.value);
    put.bind(4, std::string_view(mark.text)).run();
  }
}

std::string placeOf(const LinuxFigure& figure) {
  return std::string(figure.file) + ' ' + std::string(figure.field);
}

/// Compares the last collection's marks with this one's readings.
class Collection {
 public:
  Collection(const Marks& last, FigureReadings readings)
      : _last(last), _readings(std::move(readings)) {
    const auto boot = _last.find(kBootPlace);
    _isFirst = boot == _last.end();
    const std::string lastBoot = _isFirst ? "" : boot->second.text;
    _isUnsure = !_isFirst && _readings.boot.empty() && !lastBoot.empty();
    _goesOn = !_isFirst && (_isUnsure || lastBoot == _readings.boot);
    _isNewBoot = !_goesOn && !lastBoot.empty();
    _isWholeBoot = _isNewBoot || (_goesOn && boot->second.device != 0);
    _next[kBootPlace] = {_isWholeBoot, 0, _isUnsure ? lastBoot : _readings.boot};
  }

  void addTo(CounterStore& store, const Date& now) {
    const LinuxFigure& boots =
        *std::ranges::find(linuxFigures, FigureKind::Boots, &LinuxFigure::kind);
    if (_isUnsure) {
      _readings.problems.try_emplace(std::string(boots.file),
                                     "not known; growth waits until it is");
    } else {
      mergeFigure(_growths, boots, std::string(boots.key), _isNewBoot);
    }
    for (const FigureReading& reading : _readings.figures) {
      if (reading.figure->kind == FigureKind::Gauge) {
        mergeFigure(_gauges, *reading.figure, reading.key, reading.value);
      } else if (!_isUnsure) {
        count(reading);
      }
    }
    if (_isFirst) {
      return;
    }
    const std::int32_t day = daysSince1970(now);
    const auto second = static_cast<std::int32_t>(now.seconds - startOfDay(day).seconds);
    for (const auto& [key, growth] : _growths) {
      store.addToScalar(day, key, growth);
    }
    for (const auto& [key, value] : _gauges) {
      const Sample sample{static_cast<double>(value), second};
      store.appendSamples(day, key, {&sample, 1});
    }
  }

  /// Lines for what is left out and was not reported before.
  std::vector<std::string> complaints() {
    std::vector<std::string> lines;
    for (auto& [path, problem] : _readings.problems) {
      const Mark* reported = known(path);
      if (reported == nullptr || reported->text != problem) {
        lines.push_back("left out: " + path + ": " + problem);
      }
      _next[path].text = std::move(problem);
    }
    return lines;
  }

  /// What is to be remembered.
  Marks next() {
    for (const LinuxFigure& figure : linuxFigures) {
      if (!_isUnsure && figure.kind == FigureKind::Counter &&
          _readings.listed.contains(figure.file)) {
        _next[placeOf(figure)] = {};
      }
    }
    for (const auto& [place, mark] : _last) {
      if (_goesOn && _next.size() < kMaxMarks) {
        _next.try_emplace(place, mark);
      }
    }
    return std::move(_next);
  }

 private:
  const Mark* known(const std::string& place) const {
    const auto mark = _goesOn ? _last.find(place) : _last.end();
    return mark != _last.end() ? &mark->second : nullptr;
  }

  /// The value from which a figure grows; nothing when it is not known.
  std::optional<std::int64_t> baseOf(const FigureReading& reading) const {
    const Mark* mark = known(reading.place);
    if (mark != nullptr && mark->value != kUnread) {
      const bool isOther =
          mark->device != 0 && reading.device != 0 && mark->device != reading.device;
      return isOther || reading.value < mark->value ? 0 : mark->value;
    }
    // It began with this boot or, as a device that was not there the last time, after that.
    const bool isNewDevice = mark == nullptr && known(placeOf(*reading.figure)) != nullptr;
    return _isWholeBoot || isNewDevice ? std::optional(0) : std::nullopt;
  }

  void count(const FigureReading& reading) {
    if (reading.value == kUnread) {
      const Mark* mark = known(reading.place);
      _next[reading.place] = mark != nullptr ? *mark : Mark{reading.device, kUnread};
      return;
    }
    if (const std::optional<std::int64_t> base = baseOf(reading)) {
      mergeFigure(_growths, *reading.figure, reading.key, reading.value - *base);
    }
    _next[reading.place] = {reading.device, reading.value};
  }

  const Marks& _last;
  FigureReadings _readings;
  Marks _next;
  std::map<std::string, std::int64_t> _growths;
  std::map<std::string, std::int64_t> _gauges;
  bool _isFirst = false;      ///< nothing is marked yet
  bool _isUnsure = false;     ///< the boot was known and is not now
  bool _goesOn = false;       ///< the marks are of this boot
  bool _isNewBoot = false;    ///< the last time was in an earlier boot
  bool _isWholeBoot = false;  ///< a figure without a mark has grown from 0 since the last time
};

}  // namespace

std::vector<std::string> collectFigures(CounterStore& store, const std::string& root,
                                        const Date& now) {
  // Read within the transaction: no other process can have counted a later reading.
  store.makeMarkTable();
  const Marks last = readMarks(store.connection());
  Collection collection(last, readFigures(root, [](const LinuxFigure&) { return true; }));
  collection.addTo(store, now);
  std::vector<std::string> complaints = collection.complaints();
  Marks next = collection.next();
  next[kBootPlace].value = now.seconds;
  writeMarks(store.connection(), next);
  return complaints;
}

std::optional<Date> lastCollection(CounterStore& store) {
  return store.readTwice([&store]() -> std::optional<Date> {
    SqliteStatement table(store.connection(), "SELECT 1 FROM sqlite_master WHERE name = 'mark'");
    if (!table.step()) {
      return std::nullopt;
    }
    SqliteStatement mark(store.connection(), "SELECT value FROM mark WHERE place = ?");
    mark.bind(1, std::string_view(kBootPlace));
    return mark.step() && mark.integer(0) != 0 ? std::optional(Date{mark.integer(0)})
                                               : std::nullopt;
  });
}

}  // namespace vesprun
