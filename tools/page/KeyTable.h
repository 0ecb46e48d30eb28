#pragma once

#include <cstddef>
#include <functional>
#include <string>
#include <string_view>
#include <vector>

#include "page/Charts.h"
#include "page/Document.h"

namespace vesprun {

/// A key's row in a table of keys.
struct KeyCourse {
  std::string_view key;
  std::string words{};  ///< what it tells of, when that is known
  std::vector<Point> line{};
  std::string newest{};
  std::string ended{};  ///< when the newest value is older than the page
  std::string usual{};
  std::string lowest{};
  std::string highest{};
  bool isUnusual = false;
  Element details{};  ///< what unfolds below the key
};

/// How a page shows its keys, by how many there are: each with a line and what unfolds below it,
/// or, when there are thousands, as a line of text each, which the page's script makes a row with a
/// line when its group is unfolded.
class KeyTable {
 public:
  /// `textBytes` is the length of all keys of the page together.
  KeyTable(Period period, std::size_t keys, std::size_t textBytes);

  bool isDetailed() const { return _columns == 0; }

  /// Adds the keys in groups of those that begin alike. `courseOf` is asked for each of them, by
  /// its place in `keys`, which are sorted.
  void add(Document& document, const std::vector<std::string_view>& keys,
           const std::function<KeyCourse(std::size_t place)>& courseOf) const;

  /// The keys alone.
  void addNames(Document& document, const std::vector<std::string_view>& keys) const;

 private:
  Element row(const KeyCourse& course) const;
  Element textRow(const KeyCourse& course, std::size_t prefix) const;
  std::string shownKey(std::string_view key, std::size_t prefix) const;

  Period _period;
  bool _isOpen;               ///< the groups are few
  std::size_t _columns = 0;   ///< of a line in letters; 0: lines are drawn
  std::size_t _keyBytes = 0;  ///< that a key may have where lines are in letters
  bool _hasPrefixes = true;   ///< of the keys there; else they stand at the group alone
};

/// A name with what unfolds below it, and with its full text there when it is shown cut.
Element foldedName(std::string_view name, Element content = {});

}  // namespace vesprun
