#include "NANDInfo/tables/FieldSets.h"

#include "NANDInfo/tables/FieldRows.h"

namespace vesprun {

constinit const FieldTable WhitelistedRawNANDFTLCounters_SigDigDict =
    fieldTableOf<FieldList::FTL>();
constinit const FieldTable WhitelistedRawNANDMSPCounters_SigDigDict =
    fieldTableOf<FieldList::MSP>();
constinit const FieldTable WhitelistedStorageStats_SigDigDict = fieldTableOf<FieldList::Storage>();
constinit const FieldTable FTLStats4MSPStats = fieldTableOf<FieldList::Derived>();

}  // namespace vesprun
