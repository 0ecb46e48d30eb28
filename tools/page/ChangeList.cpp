#include "page/ChangeList.h"

#include <algorithm>

#include "page/Quantity.h"

namespace vesprun {

Element changeList(std::vector<ChangeItem> items) {
  static constexpr const char* kClasses[] = {"plain", "look", "act"};
  std::stable_sort(items.begin(), items.end(), [](const ChangeItem& left, const ChangeItem& right) {
    return left.rank > right.rank;
  });
  Element list("ol", {{"class", "changes"}});
  const std::size_t shown = std::min(items.size(), kMaxChanges);
  for (std::size_t i = 0; i < shown; ++i) {
    ChangeItem& item = items[i];
    Element what("div", {{"class", "what"}}, Element("b", {}, item.what));
    if (!item.key.empty()) {
      what.add(" ").add(nameElement(item.key));
    }
    Element row("li", {{"class", kClasses[static_cast<int>(item.level)]}}, std::move(what));
    row.add({"div", {{"class", "line"}}, std::move(item.line)});
    Element figures("div", {{"class", "figures"}});
    if (!item.now.empty()) {
      figures.add({"b", {}, item.now}).add(" ");
    }
    figures.add({"small", {}, item.then});
    list.add(row.add(std::move(figures)));
  }
  Element part(std::vector<Element>{std::move(list)});
  if (items.size() > shown) {
    part.add({"p",
              {},
              "And " + countedNoun(items.size() - shown, "smaller change") +
                  "; the keys below are marked."});
  }
  return part;
}

}  // namespace vesprun
