#include "NANDInfo/tables/FieldTable.h"

namespace vesprun {

const FieldRange* FieldTable::find(const FieldName& name) const {
  const std::size_t mask = _slots.size() - 1;
  std::size_t slot = hashOfText(name.stem) & mask;
  while (_slots[slot] != 0 && _ranges[_slots[slot] - 1U].stem != name.stem) {
    slot = (slot + 1) & mask;
  }
  for (std::size_t range = _slots[slot]; range != 0; range = _nextOfStem[range - 1]) {
    if (_ranges[range - 1].contains(name.number)) {
      return &_ranges[range - 1];
    }
  }
  return nullptr;
}

}  // namespace vesprun
