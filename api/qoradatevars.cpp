// Date variable calls: the date variable information as an array of int32,
// laid out as the date variables record lays it out.
#include <algorithm>
#include <cstdint>
#include <cstdlib>
#include <vector>

#include "qoracall.h"
#include "trendsinfo.h"

namespace {

enum { kFixedElements = 6 };

// The variable whose values start at the unit, or -1.
int VariableAtUnit(const QORA_DataSource& source, int32_t unit) {
    const size_t index = source.Layout().FirstAtOrAfter(unit);
    if (index >= source.Layout().Count() || source.Layout().Offset(index) != unit) return -1;
    return int(index);
}

// The information the elements describe, or the status that refuses them.
// An entry at position 0 names no variable and is left empty (the key
// entry of an array handed out comes so when there is no key).
int Parse(const QORA_DataSource& source, int numElements, const int* elements,
          QORA_TrendsInfo& info) {
    if (elements == nullptr || numElements < kFixedElements) return QORA_STATUS_BAD_DATE_INFO;
    const int64_t n = elements[2];
    if (n < 0 || n >= QORA_TrendsInfo::eMaxDateVars) return QORA_STATUS_BAD_DATE_INFO;
    if (numElements != 3 * n + 6 && numElements != 3 * n + 9) return QORA_STATUS_BAD_DATE_INFO;
    info.SetCount(int32_t(n));
    for (int i = 0; i < (numElements - kFixedElements) / 3; ++i) {
        const int* triple = elements + kFixedElements + 3 * i;
        if (triple[0] == 0) continue;
        const int index = VariableAtUnit(source, triple[0] - 1);
        const bool keyType =
            triple[1] == QORA_TrendsInfo::e_DATKEY || triple[1] == QORA_TrendsInfo::e_NONE;
        if (index < 0 || (i == n && !keyType)) return QORA_STATUS_BAD_DATE_INFO;
        info.SetEntry(source, i, index, triple[1], triple[2]);
    }
    info.SetSetting(elements[0] != 0, elements[1]);
    info.SetFirst(elements[4]);
    info.SetSecond(elements[3]);
    return QORA_STATUS_OK;
}

}  // namespace

// Information that does not hold against the dictionary is refused whole and
// the information stored before stays.
int QORA_API qoraSetDateVariables(int handle, int numElements, const int* elements) {
    return EntryCall(handle, AccessDefine, kCatchHandle, [&](FileEntry& entry) -> int {
        QORA_DataSource& source = *entry.fpDataSource;
        QORA_TrendsInfo info;
        if (const int status = Parse(source, numElements, elements, info)) return status;
        if (!info.Validate(source)) return QORA_STATUS_BAD_DATE_INFO;
        source.DateInfo() = info;
        return QORA_STATUS_OK;
    });
}

int QORA_API qoraGetDateVariables(int handle, int* numElements, int** elements) {
    if (numElements == nullptr || elements == nullptr) return kCatchCaseIn;
    *numElements = 0;
    *elements = nullptr;
    return EntryCall(handle, AccessAny, kCatchCaseIn, [&](FileEntry& entry) -> int {
        if (entry.fMode == WriteMode) return QORA_STATUS_NOT_OPENED_FOR_READING;
        const QORA_DataSource& source = *entry.fpDataSource;
        if (source.DateInfo().DateVarCount() == 0) return QORA_WARN_NO_DATE_INFO;
        const std::vector<int32_t> values = source.DateInfo().Elements(source);
        int* array = static_cast<int*>(std::malloc(values.size() * sizeof(int)));
        if (array == nullptr) return QORA_STATUS_NO_MEMORY;
        std::copy(values.begin(), values.end(), array);
        *elements = array;
        *numElements = int(values.size());
        return QORA_STATUS_OK;
    });
}

int QORA_API qoraFreeDateVariables(int* elements) {
    return GuardedCall(kCatchFree, [&] {
        std::free(elements);
        return QORA_STATUS_OK;
    });
}
