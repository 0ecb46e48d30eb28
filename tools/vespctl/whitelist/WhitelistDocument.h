#pragma once

#include <cstddef>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "config/WhitelistTable.h"
#include "vesprun/PropertyDict.h"

namespace vesprun {

/// A whitelist as it is written: with lines, and with what a later entry of the same name replaces.
class WhitelistDocument {
 public:
  /// A group, a list of it, or an entry of a list.
  struct Node {
    std::string name;
    std::size_t line;                      ///< of its `<key>`, from 1
    const PropertyValue* value = nullptr;  ///< null when a later node beside it has its name
    std::vector<Node> below{};

    const PropertyDict* dict() const { return value != nullptr ? value->dict() : nullptr; }
  };

  /// Nothing, with a text in `error`, when the bytes are not a ptree document with a dictionary at
  /// its root.
  static std::optional<WhitelistDocument> read(std::string_view bytes, std::string& error);

  const std::vector<Node>& groups() const { return _groups; }

  /// What counts on a device that is internal, or is not, when no group is switched off. Refers to
  /// the document.
  WhitelistTables tables(bool isInternalDevice) const;

 private:
  PropertyValue _root = PropertyDict();
  std::vector<Node> _groups;
};

/// The "About" of a group; null when it has none that is a dictionary.
inline const PropertyDict* aboutOf(const PropertyDict& group) {
  return group.findDict(EntryMetadata::kAbout);
}

/// Options that a report reads, by name. A dictionary of each would cost more than reading the
/// document.
using ReadOptions = std::vector<std::pair<std::string, PropertyValue>>;

/// What a report reads of the options as written.
template <typename Options>
ReadOptions readPart(const PropertyDict& written) {
  ReadOptions read;
  for (const auto& option : written) {
    if (Options::isRead(option.first)) {
      read.push_back(option);
    }
  }
  return read;
}

/// Calls `take(Options())` with the kind of the list of that name; false for any other name.
template <typename Take>
bool withKindOfList(std::string_view list, const Take& take) {
  if (list == ScalarOptions::kKeyList || list == ScalarOptions::kPrefixList) {
    take(ScalarOptions());
  } else if (list == DistributionOptions::kKeyList || list == DistributionOptions::kPrefixList) {
    take(DistributionOptions());
  } else {
    return false;
  }
  return true;
}

/// The options for people: "bucket_interval 10, sig_fig 2".
std::string optionsText(const ReadOptions& read, bool areOfDistribution);

/// Appends their JSON form.
void appendJsonText(const ReadOptions& read, std::string& text);

/// A text cut in the middle when it is long, since untrusted texts may be of any length.
std::string shortened(std::string_view text);

inline std::string inQuotes(std::string_view text) { return '"' + shortened(text) + '"'; }

}  // namespace vesprun
