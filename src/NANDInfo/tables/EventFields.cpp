#include "NANDInfo/tables/EventFields.h"

#include "NANDInfo/tables/FieldRows.h"

namespace vesprun {

constinit const FieldTable massStorage_NANDInfo_FTLCounters_1 =
    fieldTableOf<FieldList::FTLCounters>();
constinit const FieldTable massStorage_NANDInfo_FTLHistograms_1 =
    fieldTableOf<FieldList::FTLHistograms1>();
constinit const FieldTable massStorage_NANDInfo_FTLHistograms_2 =
    fieldTableOf<FieldList::FTLHistograms2>();
constinit const FieldTable massStorage_NANDInfo_MSPCounters_1 =
    fieldTableOf<FieldList::MSPCounters>();
constinit const FieldTable massStorage_NANDInfo_StorageStats_1 =
    fieldTableOf<FieldList::StorageStats>();
constinit const FieldTable massStorage_NANDInfo_SM_Daily_FTLCounters_1 =
    fieldTableOf<FieldList::Daily>();
constinit const FieldTable massStorage_NANDInfo_SM_WeeklyMA_FTLCounters_1 =
    fieldTableOf<FieldList::Weekly>();
constinit const FieldTable massStorage_NANDInfo_SM_Monthly_FTLCounters_1 =
    fieldTableOf<FieldList::Monthly>();

}  // namespace vesprun
