#include "NANDInfo/structuredlog/StructuredLogGlobals.h"

#include "common/ProcessState.h"

namespace vesprun {

std::uint8_t gForceCollectionSet = 0;
std::uint8_t gNeedValidityList = 0;
double gCurrentUserWamp = 0.0;
double gCurrentSysWamp = 0.0;

namespace {

const ProcessState kStructuredLogState([] {
  gForceCollectionSet = 0;
  gNeedValidityList = 0;
  gCurrentUserWamp = 0.0;
  gCurrentSysWamp = 0.0;
});

}  // namespace

}  // namespace vesprun
