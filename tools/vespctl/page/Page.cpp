#include "page/Page.h"

#include "common/Calendar.h"
#include "page/DeviceKeys.h"
#include "page/Overview.h"
#include "page/Quantity.h"
#include "page/Sections.h"

namespace vesprun {
namespace {

Element contents(const PageAbout& about, const PageData& data) {
  Element nav("nav", {{"aria-label", "Contents"}});
  const auto add = [&nav](ConstantText anchor, std::string text) {
    nav.add({"a", {{"href", anchor.text()}}, std::move(text)});
  };
  add("#keys", countedNoun(data.scalars.size() + data.distributions.size(), "key"));
  add("#storage", "Storage");
  add("#reports", countedNoun(data.days.size(), "report"));
  add("#events", "Events");
  if (!about.isShared) {
    add("#left-out", countedNoun(about.keptBack.size(), "key") + " kept back");
  }
  return nav;
}

KeyTable tableOf(const PageAbout& about, const PageData& data, const PageDays& days) {
  std::size_t bytes = 0;
  const auto addKey = [&bytes](std::string_view key) { bytes += key.size(); };
  for (const auto& [key, series] : data.scalars) {
    addKey(key);
  }
  for (const auto& [key, series] : data.distributions) {
    addKey(key);
  }
  std::size_t count = data.scalars.size() + data.distributions.size();
  if (!about.isShared) {
    count += about.keptBack.size();
    for (const KeptBack& row : about.keptBack) {
      addKey(row.key);
    }
  }
  return {days.period, count, bytes};
}

}  // namespace

std::string pageText(const PageAbout& about, const PageData& data) {
  const PageDays days(data, daysSince1970(about.now));
  KeyChanges changes(data, days);
  MarkedDays marked{data.boots, {}};
  for (std::size_t i = 1; i < data.systems.size(); ++i) {
    marked.builds.push_back(data.systems[i].day);
  }
  const KeyTable table = tableOf(about, data, days);

  Document document("Reports of " + about.title);
  document.add(sharedShapes(marked, days.period));
  addOverview(document, about, data, days, changes);
  document.add(contents(about, data));
  document.add({"div", {{"id", "tools"}}});
  addKeys(document, data, days, changes, table);
  addStorage(document, data);
  addReports(document, data, days);
  addEvents(document, data);
  addOthers(document, data);
  if (!about.isShared) {
    addErrors(document, data);
    addKeptBack(document, about.keptBack, table);
  }
  return document.finished();
}

}  // namespace vesprun
