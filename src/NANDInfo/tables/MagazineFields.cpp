#include "NANDInfo/tables/MagazineFields.h"

#include "NANDInfo/tables/FieldRows.h"

namespace vesprun {

constinit const FieldTable PrivacyApprovedSMagNANDFTLCounters_Accum =
    fieldTableOf<FieldList::Accumulating>();
constinit const FieldTable PrivacyApprovedSMagNANDFTLCounters_Dynamic =
    fieldTableOf<FieldList::Dynamic>();

}  // namespace vesprun
