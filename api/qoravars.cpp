// Variable definition calls: names, labels, missing values and the display
// properties of each variable.
#include <algorithm>
#include <cstdlib>
#include <cstring>
#include <string>

#include "SystemFileDataSource.h"
#include "namerules.h"
#include "qoracall.h"
#include "qoramb.h"

namespace {

enum { kMaxLabelBytes = 256, kShortLabelBuffer = 121, kMaxShortString = 8, kShortNameBytes = 8 };

// The name rules on a name with its surrounding blanks dropped (trailing
// blanks are not counted by the rules themselves).
int CheckName(const char* name) {
    if (name == nullptr) return kNameBadLength;
    while (*name == ' ') ++name;
    const int result = QORA_CheckVariableName(name, std::strlen(name));
    return result >= kNameValid && result <= kNameBadFirst ? result : kNameBadChar;
}

bool IsMissingCount(int count) { return count >= -3 && count <= 3 && count != -1; }

// Frees what qoraGetVarNames handed out (or had allocated so far).
void FreeNames(char** names, int* types, int count) {
    if (count <= 0) return;
    FreeCallerStrings(names, count);
    std::free(types);
}

// The short name paired with a variable's name in the file's name list: a
// file being written pairs (name, short name), a file read (short, long).
const std::string* PairedShortName(const HeaderSettings& settings, const std::string& name,
                                   bool writing) {
    for (const auto& [first, second] : settings.fNameList) {
        if (writing && first == name) return &second;
        if (!writing && second == name) return &first;
    }
    return nullptr;
}

}  // namespace

int QORA_API qoraValidateVarname(const char* name) { return CheckName(name); }

int QORA_API qoraSetVarName(int handle, const char* name, int type) {
    return EntryCall(handle, AccessDefine, kCatchHandle, [&](FileEntry& entry) -> int {
        const bool present = entry.FindVariable(name) >= 0;
        if (CheckName(name) != kNameValid) return QORA_STATUS_BAD_VAR_NAME;
        if (!QORA_Variable::IsValidType(type)) return QORA_STATUS_BAD_VAR_TYPE;
        if (present) return QORA_STATUS_DUPLICATE_VAR;
        while (*name == ' ') ++name;
        QORA_Variable var(type);
        var.SetName(name);
        const int index = entry.fpDataSource->AppendVariable(var);
        entry.AddToNameIndex(index);
        return QORA_STATUS_OK;
    });
}

int QORA_API qoraGetVarHandle(int handle, const char* name, double* varHandle) {
    if (varHandle == nullptr) return kCatchHandle;
    *varHandle = 0.0;
    return EntryCall(handle, AccessAny, kCatchHandle, [&](FileEntry& entry) -> int {
        const int index = entry.FindVariable(name);
        if (index < 0) return QORA_STATUS_VAR_NOT_FOUND;
        *varHandle = index + 1.0;
        return QORA_STATUS_OK;
    });
}

int QORA_API qoraGetVarInfo(int handle, int index, char* name, int* type) {
    if (name == nullptr || type == nullptr) return kCatchHandle;
    name[0] = '\0';
    *type = 0;
    return EntryCall(handle, AccessAny, kCatchHandle, [&](FileEntry& entry) -> int {
        if (!entry.fpDataSource->IsValidIndex(index)) return QORA_STATUS_VAR_NOT_FOUND;
        const QORA_Variable& var = entry.fpDataSource->GetVariable(index);
        const std::string& varName = var.GetName();
        std::memcpy(name, varName.c_str(), varName.size() + 1);
        *type = var.GetType();
        return QORA_STATUS_OK;
    });
}

int QORA_API qoraGetVarNames(int handle, int* count, char*** names, int** types) {
    if (count == nullptr || names == nullptr || types == nullptr) return kCatchHandle;
    *count = 0;
    *names = nullptr;
    *types = nullptr;
    char** nameArray = nullptr;
    int* typeArray = nullptr;
    int n = 0;
    const int status = EntryCall(handle, AccessAny, kCatchHandle, [&](FileEntry& entry) -> int {
        const QORA_DataSource& source = *entry.fpDataSource;
        if (source.ColumnCount() == 0) return QORA_STATUS_BAD_FILE;
        nameArray = static_cast<char**>(std::calloc(size_t(source.ColumnCount()), sizeof(char*)));
        typeArray = static_cast<int*>(std::calloc(size_t(source.ColumnCount()), sizeof(int)));
        n = source.ColumnCount();
        if (nameArray == nullptr || typeArray == nullptr) return QORA_STATUS_NO_MEMORY;
        int result = QORA_STATUS_OK;
        for (int i = 0; i < n; ++i) {
            const QORA_Variable& var = source.GetVariable(i);
            nameArray[i] = CopyForCaller(var.GetName());
            if (nameArray[i] == nullptr) result = QORA_STATUS_NO_MEMORY;
            typeArray[i] = var.GetType();
        }
        return result;
    });
    if (status != QORA_STATUS_OK) {
        FreeNames(nameArray, typeArray, n);
        return status;
    }
    *count = n;
    *names = nameArray;
    *types = typeArray;
    return QORA_STATUS_OK;
}

int QORA_API qoraFreeVarNames(char** names, int* types, int count) {
    return GuardedCall(kCatchFree, [&] {
        FreeNames(names, types, count);
        return QORA_STATUS_OK;
    });
}

// Without a paired short name, the first 8 bytes of the name stand in.
int QORA_API qoraGetVarCompatName(int handle, const char* name, char* shortName) {
    if (shortName == nullptr) return kCatchHandle;
    shortName[0] = '\0';
    return EntryCall(handle, AccessAny, kCatchHandle, [&](FileEntry& entry) -> int {
        const int index = entry.FindVariable(name);
        if (!entry.HasSystemFile()) return QORA_STATUS_NO_SYSTEM_FILE;
        if (!entry.fCommitted) return QORA_STATUS_DICT_NOT_COMMITTED;
        if (index < 0) return QORA_STATUS_VAR_NOT_FOUND;
        const std::string& varName = entry.fpDataSource->GetVariable(index).GetName();
        const std::string* paired =
            PairedShortName(entry.fpSystemFile->Settings(), varName, entry.fMode == WriteMode);
        const std::string& chosen =
            paired && !paired->empty() && paired->size() <= kShortNameBytes ? *paired : varName;
        std::memset(shortName, 0, kShortNameBytes + 1);
        std::memcpy(shortName, chosen.data(), std::min(chosen.size(), size_t(kShortNameBytes)));
        return QORA_STATUS_OK;
    });
}

int QORA_API qoraSetVarLabel(int handle, const char* name, const char* label) {
    return VariableCall(handle, name, AccessDefine, [&](FileEntry&, QORA_Variable& var) -> int {
        std::string text = label != nullptr ? label : "";
        if (text.size() <= kMaxLabelBytes) {
            var.SetLabel(text.c_str(), text.size());
            return QORA_STATUS_OK;
        }
        text = mbPrefix(text, kMaxLabelBytes);
        var.SetLabel(text.c_str(), text.size());
        return QORA_WARN_LABEL_TRUNCATED;
    });
}

int QORA_API qoraGetVarLabelLong(int handle, const char* name, char* buffer, int bufferLength,
                                 int* labelLength) {
    if (buffer == nullptr || bufferLength < 1) return kCatchHandle;
    buffer[0] = '\0';
    if (labelLength != nullptr) *labelLength = 0;
    return VariableCall(handle, name, AccessAny, [&](FileEntry&, QORA_Variable& var) -> int {
        const char* label = var.GetLabel();
        if (label == nullptr) return QORA_WARN_NO_LABEL;
        mbCopyBounded(buffer, label, size_t(bufferLength));
        if (labelLength != nullptr) *labelLength = static_cast<int>(std::strlen(buffer));
        return QORA_STATUS_OK;
    });
}

int QORA_API qoraGetVarLabel(int handle, const char* name, char* buffer) {
    return qoraGetVarLabelLong(handle, name, buffer, kShortLabelBuffer, nullptr);
}

int QORA_API qoraSetVarNMissingValues(int handle, const char* name, int count, double value1,
                                      double value2, double value3) {
    return VariableCall(handle, name, AccessDefine, [&](FileEntry&, QORA_Variable& var) -> int {
        if (!IsMissingCount(count) || (count < 0 && value1 > value2))
            return QORA_STATUS_BAD_MISSING_SPEC;
        if (var.IsString()) return QORA_STATUS_NUMERIC_REQUIRED;
        var.SetMissingValues(count, &value1, &value2, &value3);
        return QORA_STATUS_OK;
    });
}

// Null value outputs are allowed: the caller may want only some of them.
int QORA_API qoraGetVarNMissingValues(int handle, const char* name, int* count, double* value1,
                                      double* value2, double* value3) {
    if (count == nullptr) return kCatchHandle;
    *count = 0;
    double* outs[3] = {value1, value2, value3};
    for (double* out : outs)
        if (out != nullptr) *out = 0.0;
    return VariableCall(handle, name, AccessAny, [&](FileEntry&, QORA_Variable& var) -> int {
        if (var.IsString()) return QORA_STATUS_NUMERIC_REQUIRED;
        double stored[3];
        const int code = var.GetMissingValues(&stored[0], &stored[1], &stored[2]);
        for (int k = 0; k < std::abs(code); ++k)
            if (outs[k] != nullptr) *outs[k] = stored[k];
        *count = code;
        return QORA_STATUS_OK;
    });
}

int QORA_API qoraSetVarCMissingValues(int handle, const char* name, int count, const char* value1,
                                      const char* value2, const char* value3) {
    return VariableCall(handle, name, AccessDefine, [&](FileEntry&, QORA_Variable& var) -> int {
        if (count < 0 || count > 3) return QORA_STATUS_BAD_MISSING_SPEC;
        if (!var.IsString()) return QORA_STATUS_STRING_REQUIRED;
        if (var.GetType() > kMaxShortString) return QORA_STATUS_SHORT_STRING_REQUIRED;
        // Within the count a null value counts as empty; beyond it, none is set.
        const char* values[3] = {value1, value2, value3};
        for (int k = 0; k < 3; ++k) values[k] = k < count ? (values[k] ? values[k] : "") : nullptr;
        var.SetMissingStrings(values[0], values[1], values[2]);
        return QORA_STATUS_OK;
    });
}

// Null value buffers are allowed, as for the numeric form.
int QORA_API qoraGetVarCMissingValues(int handle, const char* name, int* count, char* value1,
                                      char* value2, char* value3) {
    if (count == nullptr) return kCatchHandle;
    *count = 0;
    char* outs[3] = {value1, value2, value3};
    for (char* out : outs)
        if (out != nullptr) out[0] = '\0';
    return VariableCall(handle, name, AccessAny, [&](FileEntry&, QORA_Variable& var) -> int {
        if (!var.IsString()) return QORA_STATUS_STRING_REQUIRED;
        const int width = var.GetType();
        if (width > kMaxShortString) return QORA_STATUS_SHORT_STRING_REQUIRED;
        char stored[3][8];
        const int code = var.GetMissingValues(stored[0], stored[1], stored[2]);
        for (int k = 0; k < std::abs(code); ++k) {
            if (outs[k] == nullptr) continue;
            std::memcpy(outs[k], stored[k], size_t(width));
            outs[k][width] = '\0';
        }
        *count = code;
        return QORA_STATUS_OK;
    });
}

int QORA_API qoraSetVarMeasureLevel(int handle, const char* name, int level) {
    return VariableCall(handle, name, AccessDefine, [&](FileEntry&, QORA_Variable& var) {
        if (level >= 0 && level <= 3) var.SetMeasureLevel(level);
        return QORA_STATUS_OK;
    });
}

int QORA_API qoraGetVarMeasureLevel(int handle, const char* name, int* level) {
    if (level == nullptr) return kCatchHandle;
    *level = 0;
    return VariableCall(handle, name, AccessAny, [&](FileEntry&, QORA_Variable& var) {
        *level = var.GetMeasureLevel();
        return QORA_STATUS_OK;
    });
}

int QORA_API qoraSetVarAlignment(int handle, const char* name, int alignment) {
    return VariableCall(handle, name, AccessDefine, [&](FileEntry&, QORA_Variable& var) {
        if (alignment >= 0 && alignment <= 2) var.SetAlignment(alignment);
        return QORA_STATUS_OK;
    });
}

int QORA_API qoraGetVarAlignment(int handle, const char* name, int* alignment) {
    if (alignment == nullptr) return kCatchHandle;
    *alignment = 1;
    return VariableCall(handle, name, AccessAny, [&](FileEntry&, QORA_Variable& var) {
        if (var.GetAlignment() <= 2) *alignment = var.GetAlignment();
        return QORA_STATUS_OK;
    });
}

// The width is kept in 16 bits: a wider one is stored as the widest that
// fits, never wrapped round to a negative width.
int QORA_API qoraSetVarColumnWidth(int handle, const char* name, int width) {
    return VariableCall(handle, name, AccessDefine, [&](FileEntry&, QORA_Variable& var) {
        if (width >= 1) var.SetColumnWidth(static_cast<int16_t>(std::min(width, 32767)));
        return QORA_STATUS_OK;
    });
}

int QORA_API qoraGetVarColumnWidth(int handle, const char* name, int* width) {
    if (width == nullptr) return kCatchHandle;
    *width = 0;
    return VariableCall(handle, name, AccessAny, [&](FileEntry&, QORA_Variable& var) {
        *width = var.GetColumnWidth();
        return QORA_STATUS_OK;
    });
}
