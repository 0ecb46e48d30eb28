#include "page/KeyTable.h"

#include <algorithm>

#include "page/KeyGroups.h"
#include "page/Quantity.h"

namespace vesprun {
namespace {

constexpr std::size_t kManyKeys = 100;      // groups begin folded
constexpr std::size_t kTooManyKeys = 1000;  // for rows with lines of their own

Element groupTitle(const KeyGroup& group) {
  std::vector<Element> title;
  if (group.title.empty()) {
    title.emplace_back(group.isRest ? "others" : "all");
  } else {
    title.push_back(nameElement(group.title));
    title.emplace_back(group.isRest ? " others" : "");
  }
  title.emplace_back(" ");
  title.push_back(Element("small", {}, numeral(group.keys.size())));
  return title;
}

}  // namespace

KeyTable::KeyTable(Period period, std::size_t keys, std::size_t textBytes)
    : _period(period), _isOpen(keys <= kManyKeys) {
  if (keys <= kTooManyKeys) {
    return;
  }
  // What all keys together may take.
  constexpr std::size_t kMaxBytes = 7'000'000;
  constexpr std::size_t kFigures = 16;
  constexpr std::size_t kMaxColumns = 60;
  constexpr std::size_t kMinColumns = 12;
  constexpr std::size_t kMinKeyBytes = 16;
  _hasPrefixes = textBytes <= kMaxBytes / 2;
  const std::size_t each = kMaxBytes / keys;
  _keyBytes = std::max(kMinKeyBytes, std::min<std::size_t>(120, each / 2));
  const std::size_t meanBytes = std::min(_keyBytes, textBytes / keys);
  const std::size_t rest = each - std::min(each, meanBytes + kFigures);
  _columns = std::clamp(rest, kMinColumns, kMaxColumns);
}

std::string KeyTable::shownKey(std::string_view key, std::size_t prefix) const {
  return cutInTheMiddle(_hasPrefixes ? key : key.substr(prefix), _keyBytes);
}

Element KeyTable::row(const KeyCourse& course) const {
  Element title("summary", {}, nameElement(course.key));
  if (!course.words.empty()) {
    title.add(Element("small", {}, course.words));
  }
  Element head("details", {}, std::move(title));
  if (isLongName(course.key)) {
    head.add({"p", {{"class", "full"}}, Element("bdi", {}, course.key)});
  }
  head.add(course.details);
  std::vector<Element> newest{course.newest};
  if (!course.ended.empty()) {
    newest.push_back(Element("small", {}, " " + course.ended));
  }
  const auto label = [&course] {
    return course.lowest + " to " + course.highest + ", newest " + course.newest;
  };
  return {"tr",
          course.isUnusual ? Attributes{{"class", "unusual"}} : Attributes{},
          rowHead(std::move(head)),
          Element("td", {}, sparkline(course.line, _period, 1, label())),
          Element("td", {}, std::move(newest)),
          cell(course.usual),
          cell(course.lowest),
          cell(course.highest)};
}

Element KeyTable::textRow(const KeyCourse& course, std::size_t prefix) const {
  const bool isConstant = course.lowest == course.highest && course.ended.empty();
  const auto tab = [] { return Element::constant("\t"); };
  Element row(std::vector<Element>{shownKey(course.key, prefix), tab(),
                                   course.newest + (course.isUnusual ? " !" : ""), tab()});
  row.add(isConstant ? "" : course.lowest);
  row.add(tab());
  row.add(isConstant ? "" : course.highest);
  row.add(tab());
  row.add(letteredCourse(course.line, _period, _columns));
  return row.add(Element::constant("\n"));
}

void KeyTable::add(Document& document, const std::vector<std::string_view>& keys,
                   const std::function<KeyCourse(std::size_t place)>& courseOf) const {
  const Element head(
      "thead", {},
      Element("tr", {}, headCell("Key"),
              headCell(momentText(_period.first) + " … " + momentText(_period.last)),
              headCell("Newest"), headCell("Usual"), headCell("Lowest"), headCell("Highest")));
  for (const KeyGroup& group : groupKeys(keys)) {
    Element content("pre", {{"class", "rows"}});
    if (isDetailed()) {
      content = Element("table", {{"class", "keys"}}, head);
    } else {
      content.add(Element::constant("key\tnewest\tlowest\thighest\n"));
    }
    const std::size_t prefix = group.title.size();
    for (const std::size_t place : group.keys) {
      content.add(isDetailed() ? row(courseOf(place)) : textRow(courseOf(place), prefix));
    }
    document.add(folded(groupTitle(group), std::move(content), _isOpen));
  }
}

void KeyTable::addNames(Document& document, const std::vector<std::string_view>& keys) const {
  for (const KeyGroup& group : groupKeys(keys)) {
    Element content =
        isDetailed() ? Element("ul", {{"class", "names"}}) : Element("pre", {{"class", "texts"}});
    for (const std::size_t place : group.keys) {
      if (isDetailed()) {
        content.add({"li", {}, foldedName(keys[place])});
      } else {
        content.add(shownKey(keys[place], group.title.size()));
        content.add(Element::constant("\n"));
      }
    }
    document.add(folded(groupTitle(group), std::move(content), _isOpen));
  }
}

Element foldedName(std::string_view name, Element content) {
  Element all;
  if (isLongName(name)) {
    all.add({"p", {{"class", "full"}}, Element("bdi", {}, name)});
  }
  if (!content.isEmpty()) {
    all.add(std::move(content));
  }
  return all.isEmpty() ? nameElement(name) : folded(nameElement(name), std::move(all));
}

}  // namespace vesprun
