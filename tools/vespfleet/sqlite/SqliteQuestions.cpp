#include <algorithm>
#include <tuple>
#include <unordered_map>

#include "SqliteStoreParts.h"

namespace vesprun {
namespace {

/// The column of a member in `line`; 0 stands for no text.
std::string numberColumn(Member by) {
  switch (by) {
    case Member::Build:
      return "coalesce(build, 0)";
    case Member::Model:
      return "coalesce(model, 0)";
    case Member::Whitelist:
      return "whitelist";
    case Member::None:
      break;
  }
  return "0";
}

/// The mean of one device's values.
struct DeviceMean {
  long double sum = 0;
  std::int64_t count = 0;
  Int128 integers = 0;
};

}  // namespace

std::vector<SqliteStore::Line> SqliteStore::linesOf(std::int32_t day, Member by) {
  const LinesOfDays days = linesOf({day, day}, by);
  return days.empty() ? std::vector<Line>() : days.begin()->second;
}

SqliteStore::LinesOfDays SqliteStore::linesOf(const DayRange& range, Member by) {
  const std::string query =
      "SELECT day, number, device, " + numberColumn(by) + " FROM line WHERE day BETWEEN ? AND ?";
  SqliteStatement select(*_database, query.c_str());
  select.bind(1, range.from).bind(2, range.to);
  LinesOfDays days;
  while (select.step()) {
    days[static_cast<std::int32_t>(select.integer(0))].push_back(
        {select.integer(1), select.integer(2), select.integer(3)});
  }
  for (auto& [day, lines] : days) {
    std::sort(lines.begin(), lines.end(),
              [](const Line& left, const Line& right) { return left.number < right.number; });
  }
  return days;
}

std::set<std::int64_t> SqliteStore::keysOfShape(std::int64_t shape) {
  SqliteStatement find(*_database, "SELECT keys FROM shape WHERE number = ?");
  find.bind(1, shape);
  std::set<std::int64_t> keys;
  if (!find.step()) {
    throw std::out_of_range("a shape that is not there");
  }
  const auto bytes = find.bytes(0);
  PackedReader reader({reinterpret_cast<const char*>(bytes.data()), bytes.size()});
  for (std::int64_t key = 0; !reader.atEnd();) {
    key += static_cast<std::int64_t>(reader.varint());
    keys.insert(keys.end(), key);
  }
  return keys;
}

std::set<std::int64_t> SqliteStore::keysInUse() {
  std::set<std::int64_t> keys;
  SqliteStatement shapes(*_database, "SELECT DISTINCT shape FROM line");
  while (shapes.step()) {
    keys.merge(keysOfShape(shapes.integer(0)));
  }
  return keys;
}

void SqliteStore::visitKeys(const VisitKey& visit) {
  guarded([&] {
    // Each pair once: most devices have one shape, and a day has a few.
    std::set<std::pair<std::int64_t, std::int64_t>> days;
    std::vector<std::pair<std::int64_t, std::int64_t>> devices;
    SqliteStatement lines(*_database, "SELECT day, device, shape FROM line");
    while (lines.step()) {
      days.emplace(lines.integer(0), lines.integer(2));
      devices.emplace_back(lines.integer(1), lines.integer(2));
    }
    std::sort(devices.begin(), devices.end());
    devices.erase(std::unique(devices.begin(), devices.end()), devices.end());

    struct Counted {
      std::uint64_t number = 0;
      std::int64_t last = -1;  ///< device or day that was counted last
    };
    std::unordered_map<std::int64_t, std::vector<std::int64_t>> shapes;
    const auto countAll = [&](const auto& pairs) {
      std::vector<Counted> counts;
      for (const auto& [place, shape] : pairs) {
        auto [keys, isNew] = shapes.try_emplace(shape);
        if (isNew) {
          const std::set<std::int64_t> found = keysOfShape(shape);
          keys->second.assign(found.begin(), found.end());
        }
        for (const std::int64_t key : keys->second) {
          if (static_cast<std::size_t>(key) >= counts.size()) {
            counts.resize(static_cast<std::size_t>(key & kMaxKeyNumber) + 1);
          }
          Counted& counted = counts.at(static_cast<std::size_t>(key));
          counted.number += counted.last != place ? 1 : 0;
          counted.last = place;
        }
      }
      return counts;
    };
    const std::vector<Counted> devicesOf = countAll(devices);
    const std::vector<Counted> daysOf = countAll(days);
    SqliteStatement keys(*_database, "SELECT number, name, kind FROM key ORDER BY name, kind");
    while (keys.step()) {
      const auto number = static_cast<std::size_t>(keys.integer(0));
      if (number < devicesOf.size() && devicesOf[number].number != 0) {
        visit({std::string(keys.text(1)), static_cast<KeyKind>(keys.integer(2)),
               devicesOf[number].number, daysOf.at(number).number});
      }
    }
  });
}

bool SqliteStore::hasKey(std::string_view key, KeyKind kind) {
  return guarded([&] {
    const auto number = findNumber("key", key, kind);
    return number && keysInUse().contains(*number);
  });
}

bool SqliteStore::hasMember(Member by, const std::string& value) {
  return guarded([&] {
    const auto number = findNumber("text", value);
    if (!number) {
      return false;
    }
    const std::string query = "SELECT 1 FROM line WHERE " + numberColumn(by) + " = ? LIMIT 1";
    SqliteStatement find(*_database, query.c_str());
    find.bind(1, *number);
    return find.step();
  });
}

const std::string& SqliteStore::Texts::operator()(std::int64_t number) {
  const auto [text, isNew] = _known.try_emplace(number);
  if (isNew) {
    text->second = _store.textOf(number).value_or("");
  }
  return text->second;
}

MemberText SqliteStore::textOf(std::int64_t member) {
  return guarded([&]() -> MemberText {
    if (member == 0) {
      return std::nullopt;
    }
    SqliteStatement find(*_database, "SELECT name FROM text WHERE number = ?");
    find.bind(1, member);
    if (!find.step()) {
      throw std::out_of_range("a text that is not there");
    }
    return std::string(find.text(0));
  });
}

void SqliteStore::visitLastDays(Member by, const VisitDevices& visit) {
  guarded([&] {
    std::unordered_map<std::int64_t, std::pair<std::int32_t, std::int64_t>> last;
    for (const auto& [day, lines] : linesOf(DayRange{}, by)) {
      for (const Line& line : lines) {
        last[line.device] = {day, line.member};
      }
    }
    std::map<std::pair<std::int32_t, MemberText>, std::uint64_t> counts;
    std::unordered_map<std::int64_t, MemberText> texts;
    for (const auto& [device, place] : last) {
      const auto [text, isNew] = texts.try_emplace(place.second);
      if (isNew) {
        text->second = textOf(place.second);
      }
      ++counts[{place.first, text->second}];
    }
    for (const auto& [place, devices] : counts) {
      visit(place.first, place.second, devices);
    }
  });
}

void SqliteStore::visitSpreads(const ComparedGroups& groups, const VisitSpreads& visit) {
  guarded([&] {
    std::array<std::int64_t, 2> members{};
    for (std::size_t side = 0; side < 2; ++side) {
      members[side] = findNumber("text", groups.values[side]).value_or(-1);
    }
    // A line's device becomes the place of its mean, its member the side.
    LinesOfDays days = linesOf(groups.days, groups.by);
    std::unordered_map<std::int64_t, std::int64_t> places;
    for (auto& [day, lines] : days) {
      std::erase_if(lines, [&](const Line& line) {
        return line.member != members[0] && line.member != members[1];
      });
      for (Line& line : lines) {
        line.member = line.member == members[0] ? 0 : 1;
        line.device =
            places.try_emplace(line.device, static_cast<std::int64_t>(places.size())).first->second;
      }
    }
    std::array<std::vector<DeviceMean>, 2> means;
    SqliteStatement keys(*_database, "SELECT number, name, kind FROM key ORDER BY name, kind");
    while (keys.step()) {
      KeySpreads found{std::string(keys.text(1)), static_cast<KeyKind>(keys.integer(2)), {}};
      const bool isScalar = found.kind == KeyKind::Scalar;
      if (!found.key.starts_with(groups.prefix)) {
        continue;
      }
      for (auto& side : means) {
        side.assign(places.size(), {});
      }
      for (const auto& [day, lines] : days) {
        visitEntries(day, keys.integer(0), lines, [&](PackedReader& entries, const Line* line) {
          DeviceMean unused;
          DeviceMean& mean = line != nullptr ? means[static_cast<std::size_t>(line->member)]
                                                    [static_cast<std::size_t>(line->device)]
                                             : unused;
          if (isScalar) {
            mean.integers += entries.signedInteger();
            ++mean.count;
          } else {
            const Statistics values = readDistribution(entries).statistics;
            mean.sum +=
                static_cast<long double>(values.mean) * static_cast<long double>(values.count);
            mean.count += values.count;
          }
        });
      }
      for (std::size_t side = 0; side < 2; ++side) {
        std::vector<double> values;
        for (const DeviceMean& mean : means[side]) {
          if (mean.count != 0) {
            values.push_back(
                isScalar ? meanOf(mean.integers, mean.count)
                         : static_cast<double>(mean.sum / static_cast<long double>(mean.count)));
          }
        }
        found.groups[side] = spreadOf(std::move(values), !isScalar);
      }
      visit(std::move(found));
    }
  });
}

void SqliteStore::visitLines(const DayRange& range, const std::string& prefix,
                             const VisitLine& visit) {
  guarded([&] {
    struct Key {
      std::string name;
      KeyKind kind = KeyKind::Scalar;
    };
    std::map<std::int64_t, Key> keys;
    SqliteStatement select(*_database, "SELECT number, name, kind FROM key");
    while (select.step()) {
      if (select.text(1).starts_with(prefix)) {
        keys[select.integer(0)] = {std::string(select.text(1)),
                                   static_cast<KeyKind>(select.integer(2))};
      }
    }
    Texts text(*this);
    std::map<std::int64_t, std::set<std::int64_t>> shapes;
    SqliteStatement line(*_database,
                         "SELECT revision, coalesce(build, 0), coalesce(model, 0), shape, name FROM"
                         " line JOIN device ON device.number = line.device WHERE line.number = ?");
    for (const auto& [day, lines] : linesOf(range, Member::None)) {
      std::map<std::int64_t, Cursor> cursors;
      for (const Line& current : lines) {
        line.bind(1, current.number);
        if (!line.step()) {
          throw std::out_of_range("a device that is not there");
        }
        ExportedLine exported;
        exported.day = day;
        exported.revision = line.integer(0);
        if (const std::int64_t build = line.integer(1)) {
          exported.build = text(build);
        }
        if (const std::int64_t model = line.integer(2)) {
          exported.model = text(model);
        }
        const auto [shape, isNewShape] = shapes.try_emplace(line.integer(3));
        if (isNewShape) {
          shape->second = keysOfShape(shape->first);
        }
        exported.device = line.text(4);
        line.reset();
        for (const std::int64_t number : shape->second) {
          const auto key = keys.find(number);
          if (key == keys.end()) {
            continue;
          }
          Cursor& cursor = cursors.try_emplace(number, *_database, day, number).first->second;
          const bool isScalar = key->second.kind == KeyKind::Scalar;
          std::int64_t value = 0;
          PackedDistribution packed;
          do {  // past the lines that are no longer current
            if (!cursor.next()) {
              throw std::out_of_range("a value that is not there");
            }
            if (isScalar) {
              value = cursor.value().signedInteger();
            } else {
              packed = readDistribution(cursor.value());
            }
          } while (cursor.line() < current.number);
          if (isScalar) {
            exported.scalars.push_back({key->second.name, value});
            continue;
          }
          ReportedDistribution reported{key->second.name, {packed.statistics, std::nullopt}};
          if (packed.hasHistogram) {
            reported.values.histogram.emplace();
            for (const auto& [label, count] : packed.counts) {
              (*reported.values.histogram)[text(label)] = count;
            }
          }
          exported.distributions.push_back(std::move(reported));
        }
        visit(exported);
      }
    }
  });
}

}  // namespace vesprun
