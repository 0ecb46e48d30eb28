#include "page/Overview.h"

#include <algorithm>
#include <cmath>
#include <optional>

#include "common/Calendar.h"
#include "page/Quantity.h"
#include "page/StorageHealth.h"

namespace vesprun {
namespace {

using Level = ChangeItem::Level;

// The order above figures and drifts.
constexpr double kRankOfFinding = 1e9;
constexpr double kRankOfClock = 9e8;
constexpr double kRankOfStorage = 8.5e8;
constexpr double kRankOfGap = 8e8;
constexpr double kRankOfBuild = 6e8;
constexpr double kRankOfOldGap = 1;

constexpr std::int32_t kRecentDays = 28;
constexpr std::int32_t kWeek = 7;

void addFindings(std::vector<ChangeItem>& items, const std::vector<Finding>& findings) {
  constexpr std::size_t kMaxAlone = 4;
  double rank = kRankOfFinding;
  for (std::size_t i = 0; i < findings.size(); ++i) {
    if (i < kMaxAlone) {
      items.push_back(
          {rank--, Level::Act, std::string(findings[i].finding), "", "", findings[i].detail});
    } else {
      items.back().then.append("; ").append(findings[i].finding);
    }
  }
}

void addGaps(std::vector<ChangeItem>& items, const PageDays& days) {
  for (std::size_t i = 1; i < days.reported.size(); ++i) {
    const std::int32_t from = days.reported[i - 1] + 1;
    const std::int32_t to = days.reported[i] - 1;
    if (from > to || to < days.newest() - kRecentDays) {
      continue;
    }
    const bool isLong = to - from >= kRecentDays;
    items.push_back({to > days.newest() - kWeek ? kRankOfGap + to : kRankOfOldGap, Level::Look,
                     "No report of " + daysText(from, to), "",
                     countedNoun(static_cast<std::size_t>(to) - static_cast<std::size_t>(from) + 1,
                                 "missed day"),
                     isLong ? "or the clock jumped between the two reports"
                            : "vespctl catch-up submits days that still have counters"});
  }
}

void addClock(std::vector<ChangeItem>& items, const PageData& data, const PageDays& days) {
  if (!days.toCome.empty()) {
    items.push_back({kRankOfClock, Level::Look,
                     "The clock was ahead: a report of " + dayText(days.toCome.back()), "",
                     countedNoun(days.toCome.size(), "day") + " to come",
                     "left out of the comparison"});
  }
  constexpr double kMaxBack = 3600;
  const Date* before = nullptr;
  for (const SubmittedLog& log : data.submitted) {
    const Date& created = *log.document.findDate("TBLogCreationDate");
    const bool isRecent = daysSince1970(created) > days.newest() - kRecentDays;
    if (before != nullptr && isRecent && secondsBetween(*before, created) < -kMaxBack) {
      items.push_back({kRankOfClock - 1, Level::Look, "The clock went back", "",
                       minuteText(created), minuteText(*before) + " at the report before"});
    }
    before = &created;
  }
}

void addBuilds(std::vector<ChangeItem>& items, const PageData& data, const PageDays& days) {
  constexpr std::size_t kMaxBytes = 60;
  const PageData::SystemDay* before = nullptr;
  std::optional<ChangeItem> newest;
  std::size_t count = 0;
  for (const PageData::SystemDay& system : data.systems) {
    if (before != nullptr && system.day > days.newest() - kWeek && system.day <= days.newest()) {
      const std::string model =
          before->model == system.model ? "" : cutInTheMiddle(system.model, kMaxBytes) + ' ';
      newest = ChangeItem{kRankOfBuild,
                          Level::Look,
                          model.empty() ? "Another build of the system" : "Another model or build",
                          "",
                          model + cutInTheMiddle(system.build, kMaxBytes),
                          cutInTheMiddle(before->build, kMaxBytes) + " until " +
                              dayText(before->lastDay) + "; since " + dayText(system.day)};
      ++count;
    }
    before = &system;
  }
  if (newest) {
    newest->then += count > 1 ? "; " + numeral(count) + " changes in seven days" : "";
    items.push_back(std::move(*newest));
  }
}

void addStorage(std::vector<ChangeItem>& items, const PageData& data) {
  for (const HealthStatement& statement : storageHealth(data)) {
    if (statement.level == HealthStatement::Level::Act) {
      items.push_back({kRankOfStorage, Level::Act, statement.text, "", "",
                       "figures of " + momentText(std::floor(statement.day))});
    }
  }
}

std::string periodText(const PageData& data, const PageDays& days) {
  const auto first = static_cast<std::int32_t>(days.period.first);
  std::string text = daysText(first, days.newest());
  const auto count = static_cast<std::size_t>(days.newest() - first) + 1;
  const auto reported = static_cast<std::size_t>(days.reported.end() -
                                                 std::ranges::lower_bound(days.reported, first));
  text += ": " + countedNoun(count, "day");
  text += count == reported ? ", each with a report" : ", " + numeral(reported) + " with a report";
  const std::size_t left = data.days.size() - days.toCome.size() - reported;
  return text + (left > 0 ? "; " + countedNoun(left, "earlier report") + " not shown" : "") + ".";
}

/// What there is to read when it is too early to compare.
Element firstDays(const PageDays& days) {
  const std::size_t missing = kMinDaysBefore + 1 - days.reported.size();
  return {"p",
          {{"class", "first"}},
          "It is too early to say what is unusual: a day is compared with at least " +
              numeral(kMinDaysBefore) +
              " before it. Reported so far: " + countedNoun(days.reported.size(), "day") +
              ". With a report every " + "day this page begins to compare on " +
              dayText(days.newest() + static_cast<std::int32_t>(missing) + 1) + "."};
}

Element noDays(const std::string& firstReport) {
  return {"p",
          {{"class", "first"}},
          "Nothing has been reported yet. " + firstReport +
              " What is unusual is shown here from the " + numeral(kMinDaysBefore + 1) +
              "th report on."};
}

}  // namespace

void addOverview(Document& document, const PageAbout& about, const PageData& data,
                 const PageDays& days, KeyChanges& changes) {
  std::string names;
  for (const std::string& name : about.names) {
    names += (names.empty() ? "" : " · ") + name;
  }
  const std::string made = "Page made " + minuteText(about.now) + " UTC.";
  document.add(pageHeader(
      about.title,
      {Element("bdi", {}, names), days.isEmpty() ? made : periodText(data, days) + ' ' + made}));
  document.add(Element::constant("\n<main>"));
  document.beginSection("changed", "What changed");
  std::vector<ChangeItem> items;
  addStorage(items, data);
  if (!days.isEmpty()) {
    addClock(items, data, days);
    addGaps(items, days);
    addBuilds(items, data, days);
  }
  std::move(changes.today.begin(), changes.today.end(), std::back_inserter(items));
  // A device may need attention on a day that is quiet.
  const bool isQuiet = items.empty();
  addFindings(items, about.findings);
  const std::size_t left = kMaxChanges - std::min(kMaxChanges, items.size());
  if (days.isEmpty()) {
    document.add(noDays(about.firstReport));
  } else {
    const std::int32_t yesterday = daysSince1970(about.now) - 1;
    if (days.newest() < yesterday) {
      document.add({"p",
                    {},
                    "The newest report is of " + dayText(days.newest()) + "; nothing is there of " +
                        daysText(days.newest() + 1, yesterday) + " yet."});
    }
    if (!days.areEnough()) {
      document.add(firstDays(days));
    } else if (isQuiet) {
      document.add({"p",
                    {{"class", "quiet"}},
                    "A quiet day: on " + dayText(days.newest()) + " nothing of " +
                        countedNoun(data.scalars.size() + data.distributions.size(), "key") +
                        " was unusual."});
    } else {
      document.add({"p",
                    {{"class", "key"}},
                    dayText(days.newest()) + " beside the day before and the 28 reported days " +
                        "before it; the most unusual first."});
    }
  }
  if (!items.empty()) {
    document.add(changeList(std::move(items)));
  }
  if (!changes.earlier.empty() && left > 0) {
    std::ranges::stable_sort(changes.earlier, std::greater<>(), &ChangeItem::rank);
    changes.earlier.resize(std::min(left, changes.earlier.size()));
    document.add({"h3", {}, "Earlier in the last seven days"});
    document.add(changeList(std::move(changes.earlier)));
  }
  document.endSection();
}

}  // namespace vesprun
