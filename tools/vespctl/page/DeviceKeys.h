#pragma once

#include <cstdint>
#include <map>
#include <string_view>
#include <vector>

#include "page/ChangeList.h"
#include "page/Changes.h"
#include "page/Charts.h"
#include "page/KeyWords.h"
#include "page/PageData.h"

namespace vesprun {

/// The days that a page is about.
struct PageDays {
  std::vector<std::int32_t> reported;  ///< ascending, none of them still to come
  std::vector<std::int32_t> toCome;    ///< reported, though after the device's day
  Period period;                       ///< of all pictures

  PageDays(const PageData& data, std::int32_t today);

  std::int32_t newest() const { return reported.back(); }
  bool isEmpty() const { return reported.empty(); }
  /// Whether there are days enough to say what is unusual.
  bool areEnough() const { return reported.size() > kMinDaysBefore; }
};

/// One series of a key: of a scalar its values, of a distribution one of its statistics.
struct KeySeries {
  std::string_view aspect;  ///< "mean"; empty for a scalar
  std::vector<DayValue> values;
  double minScore = kMinUnusualScore;
};

/// What is known of a figure, without sentinels: −1, where no other value is negative, and integers
/// of which all bits are set.
std::vector<DayValue> knownValues(const PageData::Series& series, const PageDays& days);
bool isUnknown(const Number& value);

KeySeries seriesOf(const PageData::Series& series, const PageDays& days);
std::vector<KeySeries> seriesOf(const std::vector<PageData::DistributionDay>& distribution,
                                const PageDays& days);

/// What changed in the keys.
struct KeyChanges {
  KeyChanges(const PageData& data, const PageDays& days);

  bool isUnusual(std::string_view key) const { return _unusual.contains(key); }

  std::vector<ChangeItem> today;    ///< on the newest day
  std::vector<ChangeItem> earlier;  ///< in the week before

 private:
  void judge(std::string_view key, const std::vector<KeySeries>& all);
  void judgePresence(std::string_view key, const std::vector<DayValue>& values);
  void addPresences(std::vector<ChangeItem>& presences, const char* one, const char* many);
  ChangeItem itemOf(std::string_view key, const KeySeries& series, const Unusual& unusual) const;

  const PageDays& _days;
  std::map<std::string_view, double, std::less<>> _unusual;
  std::vector<ChangeItem> _new;
  std::vector<ChangeItem> _gone;
};

std::vector<Point> pointsOf(const std::vector<DayValue>& values);

}  // namespace vesprun
