#include "whitelist/WhitelistDocument.h"

#include <array>
#include <unordered_set>
#include <utility>

#include "common/TextForm.h"
#include "platform/host/documents/JsonForm.h"
#include "platform/host/documents/PtreeReader.h"

namespace vesprun {
namespace {

/// Finds the values of the nodes, which are the entries of `dict`.
void findValues(std::vector<WhitelistDocument::Node>& nodes, const PropertyDict& dict) {
  const auto take = [](WhitelistDocument::Node& node, const PropertyValue& value) {
    node.value = &value;
    if (node.dict() != nullptr) {
      findValues(node.below, *node.dict());
    }
  };
  if (nodes.size() == dict.size()) {  // no name stands twice
    auto entry = dict.begin();
    for (WhitelistDocument::Node& node : nodes) {
      take(node, entry++->second);
    }
    return;
  }
  std::unordered_set<std::string_view> later;
  for (auto node = nodes.rbegin(); node != nodes.rend(); ++node) {
    if (later.insert(node->name).second) {
      take(*node, *dict.find(node->name));
    }
  }
}

}  // namespace

std::optional<WhitelistDocument> WhitelistDocument::read(std::string_view bytes,
                                                         std::string& error) {
  constexpr std::size_t kLevels = 3;  // groups, lists, entries
  // What is below a node comes before it.
  std::array<std::vector<Node>, kLevels + 1> nodes;
  const auto take = [&nodes](std::span<const std::string_view> keys, std::size_t line,
                             const PropertyValue&) {
    if (keys.size() <= kLevels) {
      nodes[keys.size() - 1].push_back(
          {std::string(keys.back()), line, nullptr, std::exchange(nodes[keys.size()], {})});
    }
  };
  std::optional<PropertyValue> root = readPtreeEntries(bytes, error, take);
  if (!root || root->dict() == nullptr) {
    error = root ? "the root is not a dictionary" : error;
    return std::nullopt;
  }
  WhitelistDocument document;
  document._root = *std::move(root);
  document._groups = std::move(nodes[0]);
  findValues(document._groups, *std::as_const(document._root).dict());
  return document;
}

WhitelistTables WhitelistDocument::tables(bool isInternalDevice) const {
  WhitelistTables tables;
  for (const auto& [name, lists] : *_root.dict()) {
    if (lists.dict() != nullptr &&
        (isInternalDevice || !WhitelistKeyGroup::isForInternalDevices(name))) {
      tables.take({name, lists});
    }
  }
  return tables;
}

std::string optionsText(const ReadOptions& read, bool areOfDistribution) {
  std::string text;
  for (const auto& [name, value] : read) {
    text.append(text.empty() ? "" : ", ").append(name);
    const PropertyArray* array = value.array();
    if (array == nullptr) {
      text.append(" ").append(textForm(value));
      continue;
    }
    for (const PropertyValue& boundary : *array) {
      text.append(&boundary == array->data() ? " " : ", ").append(textForm(boundary));
    }
    text.append(array->empty() ? " none" : "");
  }
  return !text.empty() ? text : areOfDistribution ? "statistics alone" : "exactly as counted";
}

void appendJsonText(const ReadOptions& read, std::string& text) {
  text += '{';
  for (const auto& [name, value] : read) {
    text.append(text.back() == '{' ? "" : ",");
    appendJsonText(name, text);
    text.append(":").append(jsonText(value));
  }
  text += '}';
}

std::string shortened(std::string_view text) {
  constexpr std::size_t kEnds = 120;
  if (text.size() <= 2 * kEnds + 20) {
    return std::string(text);
  }
  // Not within a character.
  const auto isInside = [&text](std::size_t at) { return (text[at] & 0xC0) == 0x80; };
  std::size_t head = kEnds;
  std::size_t tail = text.size() - kEnds;
  while (head > kEnds - 4 && isInside(head)) {
    --head;
  }
  while (tail > text.size() - kEnds - 4 && isInside(tail)) {
    --tail;
  }
  return std::string(text.substr(0, head)).append("...").append(text.substr(tail));
}

}  // namespace vesprun
