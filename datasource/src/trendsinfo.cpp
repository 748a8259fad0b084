#include "trendsinfo.h"

#include "datasrc.h"
#include "dserror.h"

namespace {

// The name a variable of each type must have, by type; the key's is last.
const char* const kTypeNames[QORA_TrendsInfo::eMaxDateVars + 1] = {
    "",     "CYCLE_", "YEAR_",   "QUARTER_", "MONTH_", "WEEK_",
    "DAY_", "HOUR_",  "MINUTE_", "SECOND_",  "OBS_",   "DATE_"};

bool Qualifies(const QORA_Variable& var, int32_t type) {
    if (type <= QORA_TrendsInfo::e_NONE || type > QORA_TrendsInfo::e_DATKEY) return false;
    return var.GetKey() == kTypeNames[type] &&
           var.IsString() == (type == QORA_TrendsInfo::e_DATKEY);
}

}  // namespace

void QORA_TrendsInfo::Reset() {
    fnDateVars = 0;
    fVars.assign(1, Entry());
    if (!fSetting) fSettingNumber = 1;
}

void QORA_TrendsInfo::SetCount(int32_t n) {
    QORA_ASSERT(0 <= n);
    QORA_ASSERT(n < eMaxDateVars);
    Reset();
    fnDateVars = n;
    fVars.assign(size_t(n) + 1, Entry());
}

void QORA_TrendsInfo::SetEntry(const QORA_DataSource& source, int32_t i, int32_t varIndex,
                               int32_t type, int32_t value) {
    QORA_ASSERT(0 <= i);
    QORA_ASSERT(i < fnDateVars || (i == fnDateVars && (type == e_DATKEY || type == e_NONE)));
    Entry& entry = fVars[size_t(i)];
    entry.fType = type;
    if (type == e_NONE) return;
    entry.fIndex = varIndex;
    entry.fID = source.GetVariable(varIndex).GetID();
    entry.fValue = value;
}

const QORA_TrendsInfo::Entry& QORA_TrendsInfo::GetEntry(int32_t i) const {
    QORA_ASSERT(0 <= i && i <= fnDateVars);
    return fVars[size_t(i)];
}

bool QORA_TrendsInfo::Validate(const QORA_DataSource& source) {
    bool unchanged = true;
    for (int32_t i = 0; i <= fnDateVars && i < int32_t(fVars.size()); ++i) {
        Entry& entry = fVars[size_t(i)];
        if (entry.fType == e_NONE) continue;
        if (!source.IsValidIndex(entry.fIndex) ||
            source.GetVariable(entry.fIndex).GetID() != entry.fID)
            entry.fIndex = source.IndexOfID(entry.fID);
        if (entry.fIndex < 0 && i == fnDateVars) {
            entry = Entry();
            unchanged = false;
            continue;
        }
        if (entry.fIndex < 0 || !Qualifies(source.GetVariable(entry.fIndex), entry.fType)) {
            Reset();
            return false;
        }
    }
    return unchanged;
}

std::vector<int32_t> QORA_TrendsInfo::Elements(const QORA_DataSource& source) const {
    std::vector<int32_t> elements = {fSetting ? 1 : 0, fSettingNumber, fnDateVars,
                                     fSecond,          fFirst,         fnDateVars > 0 ? 1 : 0};
    if (fnDateVars == 0) return elements;
    for (const Entry& entry : fVars) {
        const int index = entry.fType == e_NONE ? -1 : source.IndexOfID(entry.fID);
        if (index < 0)
            elements.insert(elements.end(), {0, 0, 0});
        else
            elements.insert(elements.end(),
                            {source.ValueOffset(index) + 1, entry.fType, entry.fValue});
    }
    return elements;
}
