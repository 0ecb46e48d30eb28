#include "NANDInfo/parsers/KernelSnapshot.h"

#include <algorithm>
#include <cstddef>
#include <new>
#include <vector>

#include "common/LittleEndian.h"

namespace vesprun {
namespace {

using Items = std::span<const std::uint8_t>;

enum ItemType : std::uint32_t {
  kContainerBegin = 19,
  kContainerEnd = 20,
  kThreadIOStatistics = 2305,
  kThreadName = 2313,
  kBufferEnd = 0xF19158ED,
};

constexpr std::size_t kItemHeaderSize = 16;
constexpr std::size_t kNameSize = 64;

struct Item {
  std::uint32_t type;
  std::uint64_t flags;
  Items data;

  bool beginsContainer() const { return type == kContainerBegin && data.size() >= 4; }
  std::size_t size() const { return kItemHeaderSize + data.size(); }
};

/// The item at the front, unless it ends the snapshot or exceeds it.
std::optional<Item> frontItem(Items items) {
  if (items.size() < kItemHeaderSize) {
    return std::nullopt;
  }
  const auto type = loadLittleEndian<std::uint32_t>(items.data());
  const auto size = loadLittleEndian<std::uint32_t>(items.data() + 4);
  if (type == kBufferEnd || size > items.size() - kItemHeaderSize) {
    return std::nullopt;
  }
  return Item{type, loadLittleEndian<std::uint64_t>(items.data() + 8),
              items.subspan(kItemHeaderSize, size)};
}

struct Container {
  std::uint64_t identifier;
  std::optional<Items> name;
  std::optional<Items> ioStatistics;
};

bool hasName(Items item, const char* name) {
  for (std::size_t i = 0; i < std::min(item.size(), kNameSize); ++i) {
    if (item[i] != static_cast<std::uint8_t>(name[i])) {
      return false;
    }
    if (item[i] == 0) {
      return true;
    }
  }
  return true;
}

Items fromFirstContainer(Items items) {
  std::optional<Item> item = frontItem(items);
  while (item && !item->beginsContainer()) {
    items = items.subspan(item->size());
    item = frontItem(items);
  }
  return item ? items : Items();
}

bool findThread(Items snapshot, const char* threadName, std::optional<Items>& ioStatistics,
                Items* rest) {
  Items items = fromFirstContainer(snapshot);
  if (items.empty()) {
    return false;
  }
  std::vector<Container> open;  // not a recursion: a hostile snapshot nests as deep as it is long
  do {
    const std::optional<Item> item = frontItem(items);
    if (item && item->beginsContainer()) {
      open.push_back({item->flags, std::nullopt, std::nullopt});
      items = items.subspan(item->size());
      continue;
    }
    if (item && !(item->type == kContainerEnd && item->flags == open.back().identifier)) {
      if (item->type == kThreadName) {
        open.back().name = item->data;
      } else if (item->type == kThreadIOStatistics) {
        open.back().ioStatistics = item->data;
      }
      items = items.subspan(item->size());
      continue;
    }
    const Container ended = open.back();
    open.pop_back();
    if (!ended.name) {
      items = {};
      continue;
    }
    const bool found = hasName(*ended.name, threadName);
    if (rest != nullptr && (found || open.empty())) {
      *rest = items;
    }
    if (found) {
      ioStatistics = ended.ioStatistics;
      return true;
    }
  } while (!open.empty());
  return false;
}

}  // namespace

bool getIOStatsWithThreadnameFromSnapData(Items snapshot, const char* threadName,
                                          std::optional<Items>& ioStatistics) {
  return getIOStatsWithThreadnameFromSnapDataHelper(snapshot, threadName, ioStatistics, nullptr);
}

bool getIOStatsWithThreadnameFromSnapDataHelper(Items snapshot, const char* threadName,
                                                std::optional<Items>& ioStatistics, Items* rest) {
  try {
    return threadName != nullptr && findThread(snapshot, threadName, ioStatistics, rest);
  } catch (const std::bad_alloc&) {  // nests deeper than memory holds
    return false;
  }
}

}  // namespace vesprun
