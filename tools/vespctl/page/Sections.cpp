#include "page/Sections.h"

#include <algorithm>
#include <cmath>
#include <set>

#include "common/TextForm.h"
#include "page/Quantity.h"
#include "page/StorageHealth.h"

namespace vesprun {
namespace {

constexpr std::size_t kShownReports = 14;

Element unreadableFiles(const PageData& data) {
  if (data.unreadable.empty()) {
    return {};
  }
  Element list("ul", {});
  for (const UnreadableLog& file : data.unreadable) {
    list.add({"li", {}, nameElement(file.name), ": " + file.why});
  }
  return std::vector<Element>{Element("p", {{"class", "act"}}, "Not on this page:"),
                              std::move(list)};
}

Element reportRow(const SubmittedLog& log) {
  constexpr std::size_t kShownDigest = 8;
  const PropertyDict& document = log.document;
  return {"tr",
          {},
          rowHead(dayText(log.day)),
          cell(std::to_string(log.revision)),
          cell(minuteText(*document.findDate("TBLogCreationDate"))),
          cell(numeral(document.findDict("TBScalars")->size())),
          cell(numeral(document.findDict("TBDistributions")->size())),
          Element("td", {},
                  nameElement(document.findString("TBWhitelistDigest")->substr(0, kShownDigest))),
          cell(log.name.substr(0, log.name.find('-')))};
}

Element reportTable() {
  return {
      "table",
      {{"class", "reports"}},
      headRow({"Day", "Rev.", "Submitted, UTC", "Scalars", "Distributions", "Whitelist", "Log"})};
}

/// A row with the course of an event's field over the earlier events of its name.
Element fieldRow(std::string_view field, const PageData::Series& series, Period period) {
  const Unit unit = unitOfKey(field);
  std::vector<Point> points;
  for (const auto& [day, value] : series) {
    if (!isUnknown(value)) {
      points.push_back({day, value.asDouble()});
    }
  }
  const auto text = [unit](double value) { return quantity(value, unit); };
  std::string lowest;
  std::string highest;
  if (!points.empty()) {
    const auto [low, high] = std::ranges::minmax_element(points, {}, &Point::value);
    lowest = text(low->value);
    highest = text(high->value);
  }
  const Number& last = series.back().value;
  const std::string newest = isUnknown(last) ? "unknown" : text(last.asDouble());
  return {"tr",
          {},
          rowHead(foldedName(field)),
          Element("td", {},
                  sparkline(points, period, HUGE_VAL,
                            lowest + " to " + highest + ", newest " + newest, false)),
          cell(newest),
          cell(""),
          cell(lowest),
          cell(highest)};
}

/// The fields of the newest event, their numbers with their course over the earlier ones.
Element eventFields(const std::vector<PageData::Event>& events) {
  const Period period{events.front().day, events.back().day};
  Element rows("table", {{"class", "keys"}},
               headRow({"Field", "Over the events", "Newest", "", "Lowest", "Highest"}));
  Element texts("table", {{"class", "texts"}});
  Element zeros("p", {{"class", "names"}});
  std::size_t rowCount = 0;
  std::size_t textCount = 0;
  std::size_t zeroCount = 0;
  for (const auto& [field, value] : events.back().payload) {
    PageData::Series series;
    bool isZero = true;
    for (const PageData::Event& event : events) {
      const Number* const number = event.payload.findNumber(field);
      if (number != nullptr) {
        series.push_back({event.day, *number});
        isZero = isZero && number->asDouble() == 0;
      }
    }
    if (value.number() == nullptr) {
      texts.add(
          {"tr", {}, rowHead(foldedName(field)), Element("td", {}, foldedName(textForm(value)))});
      ++textCount;
    } else if (isZero) {
      zeros.add(zeroCount++ > 0 ? ", " : "").add(nameElement(field));
    } else {
      rows.add(fieldRow(field, series, period));
      ++rowCount;
    }
  }
  Element all;
  all.add(rowCount > 0 ? std::move(rows) : Element());
  all.add(textCount > 0 ? std::move(texts) : Element());
  return all.add(zeroCount > 0
                     ? folded(countedNoun(zeroCount, "field") + " always 0", std::move(zeros))
                     : Element());
}

}  // namespace

void addReports(Document& document, const PageData& data, const PageDays& days) {
  document.beginSection("reports", "Reports");
  document.add(unreadableFiles(data));
  if (days.isEmpty()) {
    document.add({"p", {}, "The outbox has no daily log."});
    return document.endSection();
  }
  const std::vector<double> reported(days.reported.begin(), days.reported.end());
  const std::string first = momentText(days.period.first);
  const std::string last = momentText(days.period.last);
  document.add(dayStrip(reported, days.period, "days with a report from " + first + " to " + last));
  document.add({"p", {{"class", "ends"}}, Element("span", {}, first), Element("span", {}, last)});
  Element newest = reportTable();
  Element older = reportTable();
  std::map<std::string, std::size_t> digests;
  std::size_t count = 0;
  for (auto log = data.submitted.rbegin(); log != data.submitted.rend(); ++log) {
    (count++ < kShownReports ? newest : older).add(reportRow(*log));
    ++digests[*log->document.findString("TBWhitelistDigest")];
  }
  document.add({"div", {{"class", "scroll"}}, std::move(newest)});
  if (count > kShownReports) {
    document.add(folded(countedNoun(count - kShownReports, "earlier report"),
                        Element("div", {{"class", "scroll"}}, std::move(older))));
  }
  document.add({"p", {}, "Digests of the whitelist:"});
  Element list("ul", {});
  for (const auto& [digest, times] : digests) {
    list.add(
        {"li", {}, foldedName(digest), " ", Element("small", {}, countedNoun(times, "report"))});
  }
  document.add(list);
  document.endSection();
}

void addStorage(Document& document, const PageData& data) {
  static constexpr const char* kClasses[] = {"plain", "good", "look", "act"};
  static constexpr const char* kVerdicts[] = {
      "The figures allow no verdict.", "Nothing points to wear or to failing flash.",
      "Some figures deserve a look.", "The storage needs attention."};
  const std::vector<HealthStatement> health = storageHealth(data);
  document.beginSection("storage", "Storage");
  if (health.empty()) {
    document.add({"p", {}, "No figure of the flash storage has been submitted."});
    return document.endSection();
  }
  auto worst = HealthStatement::Level::Plain;
  double newest = 0;
  for (const HealthStatement& statement : health) {
    worst = std::max(worst, statement.level);
    newest = std::max(newest, std::floor(statement.day));
  }
  const auto level = static_cast<std::size_t>(worst);
  document.add({"p",
                {{"class", std::string("verdict ") + kClasses[level]}},
                kVerdicts[level],
                " ",
                Element("small", {}, "Figures of " + momentText(newest))});
  Element list("ul", {{"class", "health"}});
  for (const HealthStatement& statement : health) {
    Element item("li", {{"class", kClasses[static_cast<std::size_t>(statement.level)]}},
                 statement.text);
    if (std::floor(statement.day) < newest) {
      item.add(" ").add({"small", {}, momentText(std::floor(statement.day))});
    }
    list.add(std::move(item));
  }
  document.add(list);
  document.endSection();
}

void addEvents(Document& document, const PageData& data) {
  document.beginSection("events", "Analytics events");
  for (const auto& [name, events] : data.events) {
    const double last = events.newest.back().day;
    const std::vector<Element> title{
        nameElement(name), " ",
        Element(
            "small", {},
            numeral(events.count) + " sent" + (last > 0 ? ", the last " + momentText(last) : ""))};
    Element content;
    if (isLongName(name)) {
      content.add({"p", {{"class", "full"}}, name});
    }
    document.add(folded(title, content.add(eventFields(events.newest))));
  }
  if (data.events.empty()) {
    document.add({"p", {}, "No analytics event has been sent."});
  }
  document.endSection();
}

void addOthers(Document& document, const PageData& data) {
  if (data.others.empty()) {
    return;
  }
  document.beginSection("others", "Other logs and records");
  Element list("ul", {});
  for (const auto& [what, count] : data.others) {
    list.add({"li", {}, nameElement(what), " ", Element("small", {}, numeral(count))});
  }
  document.add(list);
  document.endSection();
}

void addErrors(Document& document, const PageData& data) {
  if (data.errors.count == 0) {
    return;
  }
  document.beginSection("errors", "Errors in the system log");
  document.add({"p",
                {},
                "The newest " + numeral(data.errors.newest.size()) + " of " +
                    numeral(data.errors.count) + "."});
  Element list("ul", {});
  for (auto line = data.errors.newest.rbegin(); line != data.errors.newest.rend(); ++line) {
    list.add({"li", {}, foldedName(*line)});
  }
  document.add(list);
  document.endSection();
}

void addKeptBack(Document& document, const std::vector<KeptBack>& keptBack, const KeyTable& table) {
  document.beginSection("left-out", "Kept back");
  document.add({"p",
                {},
                keptBack.empty()
                    ? "Every key of the counter database may leave the device."
                    : "These keys are in the counter database and do not leave the device. Their "
                      "values are not on this page."});
  for (const bool isDistribution : {false, true}) {
    std::set<std::string_view> sorted;
    for (const KeptBack& row : keptBack) {
      if (row.isDistribution == isDistribution) {
        sorted.insert(row.key);
      }
    }
    if (!sorted.empty()) {
      document.add(
          {"h3", {}, countedNoun(sorted.size(), isDistribution ? "distribution" : "scalar")});
      table.addNames(document, {sorted.begin(), sorted.end()});
    }
  }
  document.endSection();
}

}  // namespace vesprun
