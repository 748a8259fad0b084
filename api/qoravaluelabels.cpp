// Value label calls: labels for single values of a variable, one at a time
// or as a set shared by several variables, and the arrays handed out.
#include <cstdlib>
#include <cstring>
#include <string>
#include <type_traits>
#include <vector>

#include "qoracall.h"
#include "qoramb.h"

namespace {

enum { kMaxValueLabel = 120, kShortLabelBuffer = 61 };

// The stored form of a caller's label: at most 120 bytes, cut at a whole
// character. *cut tells whether anything was dropped.
std::string StoredLabel(const char* label, bool* cut) {
    if (label == nullptr) return std::string();
    char buffer[kMaxValueLabel + 1];
    mbCopyBounded(buffer, label, sizeof buffer);
    const size_t length = std::strlen(buffer);
    if (label[length] != '\0') *cut = true;
    return std::string(buffer, length);
}

// The variable check of every call: 0 when the variable's kind suits the
// call, else 14 (numeric needed) or 15 (string needed).
int CheckKind(const QORA_Variable& var, bool numeric) {
    if (numeric && var.IsString()) return QORA_STATUS_NUMERIC_REQUIRED;
    if (!numeric && !var.IsString()) return QORA_STATUS_STRING_REQUIRED;
    return QORA_STATUS_OK;
}

// A string value as the caller gives it: up to its terminator, at most the
// variable's width, cut at a whole character; the map pads it with blanks.
void InsertLabel(QORA_VLMap& map, const QORA_Variable& var, const void* value,
                 const std::string& label) {
    if (var.IsString())
        map.Insert(static_cast<const char*>(value), var.GetType(), label);
    else
        map.Insert(*static_cast<const double*>(value), label);
}

// Adds or replaces one label on a copy of the variable's map and installs it.
int SetOneLabel(int handle, const char* varName, bool numeric, const void* value,
                const char* label) {
    return VariableCall(handle, varName, AccessDefine, [&](FileEntry&, QORA_Variable& var) -> int {
        if (const int status = CheckKind(var, numeric)) return status;
        QORA_VLMap map = var.GetValueLabels();
        if (!map.IsValid()) map = QORA_VLMap(var.GetType());
        bool cut = false;
        InsertLabel(map, var, value, StoredLabel(label, &cut));
        var.SetValueLabels(map);
        return cut ? QORA_WARN_VALUE_LABEL_TRUNCATED : QORA_STATUS_OK;
    });
}

// Replaces the labels of every named variable with one new map. values
// points at numLabels doubles, or numLabels string pointers.
int SetLabelSet(int handle, const char* const* varNames, int numVars, bool numeric,
                const void* values, const char* const* labels, int numLabels) {
    return EntryCall(handle, AccessDefine, kCatchHandle, [&](FileEntry& entry) -> int {
        if ((numVars > 0 && varNames == nullptr) ||
            (numLabels > 0 && (values == nullptr || labels == nullptr)))
            return kCatchHandle;
        std::vector<int> indexes;
        for (int i = 0; i < numVars; ++i) {
            const int index = entry.FindVariable(varNames[i]);
            if (index < 0) return QORA_STATUS_VAR_NOT_FOUND;
            const QORA_Variable& var = entry.fpDataSource->GetVariable(index);
            if (const int status = CheckKind(var, numeric)) return status;
            const int firstType = indexes.empty()
                                      ? var.GetType()
                                      : entry.fpDataSource->GetVariable(indexes[0]).GetType();
            if (var.GetType() != firstType) return QORA_STATUS_WIDTH_MISMATCH;
            indexes.push_back(index);
        }
        if (indexes.empty()) return QORA_STATUS_OK;
        const QORA_Variable& first = entry.fpDataSource->GetVariable(indexes[0]);
        QORA_VLMap map(first.GetType());
        bool cut = false;
        for (int k = 0; k < numLabels; ++k) {
            const void* value =
                numeric ? static_cast<const void*>(static_cast<const double*>(values) + k)
                        : static_cast<const char* const*>(values)[k];
            InsertLabel(map, first, value, StoredLabel(labels[k], &cut));
        }
        for (int index : indexes) entry.fpDataSource->GetVariable(index).SetValueLabels(map);
        return cut ? QORA_WARN_VALUE_LABEL_TRUNCATED : QORA_STATUS_OK;
    });
}

int GetOneLabel(int handle, const char* varName, bool numeric, const void* value, char* label,
                int labelSize, int* labelLength) {
    if (label == nullptr || labelSize < 1) return kCatchHandle;
    label[0] = '\0';
    if (labelLength != nullptr) *labelLength = 0;
    return VariableCall(handle, varName, AccessAny, [&](FileEntry&, QORA_Variable& var) -> int {
        if (const int status = CheckKind(var, numeric)) return status;
        const QORA_VLMap map = var.GetValueLabels();
        if (map.Count() == 0) return QORA_WARN_NO_LABELS;
        const std::string* text = numeric
                                      ? map.Lookup(*static_cast<const double*>(value))
                                      : map.Lookup(static_cast<const char*>(value), var.GetType());
        if (text == nullptr) return QORA_WARN_NO_LABEL;
        mbCopyBounded(label, text->c_str(), size_t(labelSize));
        if (labelLength != nullptr) *labelLength = static_cast<int>(std::strlen(label));
        return QORA_STATUS_OK;
    });
}

// Hands out every label of a variable: values (doubles, or copies of the
// blank-padded string fields) and copies of the labels, in the map's order.
// On failure nothing stays allocated.
template <typename ValueOut, typename FreeValues>
int GetAllLabels(int handle, const char* varName, bool numeric, ValueOut** values, char*** labels,
                 int* numLabels, FreeValues freeValues) {
    if (values == nullptr || labels == nullptr || numLabels == nullptr) return kCatchHandle;
    *values = nullptr;
    *labels = nullptr;
    *numLabels = 0;
    ValueOut* valueArray = nullptr;
    char** labelArray = nullptr;
    int count = 0;
    const int status =
        VariableCall(handle, varName, AccessAny, [&](FileEntry&, QORA_Variable& var) -> int {
            if (const int kind = CheckKind(var, numeric)) return kind;
            QORA_VLMap map = var.GetValueLabels();
            if (map.Count() == 0) return QORA_WARN_NO_LABELS;
            count = map.Count();
            valueArray = static_cast<ValueOut*>(std::calloc(size_t(count), sizeof(ValueOut)));
            labelArray = static_cast<char**>(std::calloc(size_t(count), sizeof(char*)));
            if (valueArray == nullptr || labelArray == nullptr) return QORA_STATUS_NO_MEMORY;
            std::string units, text;
            map.Reset();
            for (int i = 0; i < count; ++i) {
                if constexpr (std::is_same_v<ValueOut, double>) {
                    map.NextNumber(valueArray[i], text);
                } else {
                    map.Next(units, text);
                    valueArray[i] = CopyForCaller(units);
                    if (valueArray[i] == nullptr) return QORA_STATUS_NO_MEMORY;
                }
                labelArray[i] = CopyForCaller(text);
                if (labelArray[i] == nullptr) return QORA_STATUS_NO_MEMORY;
            }
            return QORA_STATUS_OK;
        });
    if (status != QORA_STATUS_OK) {
        FreeCallerStrings(labelArray, count);
        freeValues(valueArray, count);
        return status;
    }
    *values = valueArray;
    *labels = labelArray;
    *numLabels = count;
    return QORA_STATUS_OK;
}

void FreeNumbers(double* values, int) { std::free(values); }

}  // namespace

int QORA_API qoraSetVarNValueLabel(int handle, const char* varName, double value,
                                   const char* label) {
    return SetOneLabel(handle, varName, true, &value, label);
}

int QORA_API qoraSetVarCValueLabel(int handle, const char* varName, const char* value,
                                   const char* label) {
    return SetOneLabel(handle, varName, false, value != nullptr ? value : "", label);
}

int QORA_API qoraSetVarNValueLabels(int handle, const char* const* varNames, int numVars,
                                    const double* values, const char* const* labels,
                                    int numLabels) {
    return SetLabelSet(handle, varNames, numVars, true, values, labels, numLabels);
}

int QORA_API qoraSetVarCValueLabels(int handle, const char* const* varNames, int numVars,
                                    const char* const* values, const char* const* labels,
                                    int numLabels) {
    return SetLabelSet(handle, varNames, numVars, false, values, labels, numLabels);
}

int QORA_API qoraGetVarNValueLabelLong(int handle, const char* varName, double value, char* label,
                                       int labelSize, int* labelLength) {
    return GetOneLabel(handle, varName, true, &value, label, labelSize, labelLength);
}

int QORA_API qoraGetVarCValueLabelLong(int handle, const char* varName, const char* value,
                                       char* label, int labelSize, int* labelLength) {
    return GetOneLabel(handle, varName, false, value != nullptr ? value : "", label, labelSize,
                       labelLength);
}

int QORA_API qoraGetVarNValueLabel(int handle, const char* varName, double value, char* label) {
    return qoraGetVarNValueLabelLong(handle, varName, value, label, kShortLabelBuffer, nullptr);
}

int QORA_API qoraGetVarCValueLabel(int handle, const char* varName, const char* value,
                                   char* label) {
    return qoraGetVarCValueLabelLong(handle, varName, value, label, kShortLabelBuffer, nullptr);
}

int QORA_API qoraGetVarNValueLabels(int handle, const char* varName, double** values,
                                    char*** labels, int* numLabels) {
    return GetAllLabels(handle, varName, true, values, labels, numLabels, FreeNumbers);
}

int QORA_API qoraGetVarCValueLabels(int handle, const char* varName, char*** values, char*** labels,
                                    int* numLabels) {
    return GetAllLabels(handle, varName, false, values, labels, numLabels, FreeCallerStrings);
}

int QORA_API qoraFreeVarNValueLabels(double* values, char** labels, int numLabels) {
    return GuardedCall(kCatchFree, [&] {
        FreeCallerStrings(labels, numLabels);
        std::free(values);
        return QORA_STATUS_OK;
    });
}

int QORA_API qoraFreeVarCValueLabels(char** values, char** labels, int numLabels) {
    return GuardedCall(kCatchFree, [&] {
        FreeCallerStrings(labels, numLabels);
        FreeCallerStrings(values, numLabels);
        return QORA_STATUS_OK;
    });
}
