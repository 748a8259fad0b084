// Print and write formats: what a caller may give a variable of a type.
#include "qoracall.h"

namespace {

enum { kDefaultCode = 5, kDefaultWidth = 8, kDefaultDecimals = 2 };

// Format codes a caller may name at all.
bool IsAcceptedCode(int code) {
    return (code >= 1 && code <= 12) || (code >= 15 && code <= 17) || (code >= 20 && code <= 39);
}

// The rules of the calling layer for one format on a variable of type t.
// They correct nothing and are separate from the dictionary's own check.
bool IsValidFormat(bool print, int t, int f, int w, int d) {
    const bool decimals = t == 0 && d >= 0 && d <= 16;  // numeric, with decimals
    const bool plain = t == 0 && d == 0;                // numeric, no decimals
    const bool writeOnly = !print;
    const bool even = w % 2 == 0;
    auto within = [w](int low, int high) { return w >= low && w <= high; };
    switch (f) {
        case 1:
            return t >= 1 && w == t && w <= 32767 && d == 0;
        case 2:
            return t >= 1 && even && within(2, 255) && d == 0;
        case 3:
        case 5:
        case 32:
            return decimals && within(d + 1, 40);
        case 4:
        case 31:
        case 33:
        case 34:
        case 35:
        case 36:
        case 37:
            return decimals && within(d + 2, 40);
        case 6:
        case 9:
            return writeOnly && decimals && within(1, 8);
        case 7:
            return plain && even && within(2, 16);
        case 8:
        case 10:
            return writeOnly && decimals && within(1, 16);
        case 11:
            return writeOnly && plain && within(2, 8);
        case 12:
            return plain && even && within(4, 16);
        case 15:
        case 16:
            return decimals && within(1, 40);
        case 17:
            return decimals && within(d + 6, 40);
        case 20:
            return plain && within(9, 40);
        case 21:
            return decimals && within(5, 40) && (d == 0 || w >= d + 9);
        case 22:
            return decimals && within(17, 40) && (d == 0 || w >= d + 21);
        case 23:
        case 30:
        case 38:
        case 39:
            return plain && within(8, 40);
        case 24:
            return plain && within(5, 40);
        case 25:
            return decimals && within(8, 40) && (d == 0 || w >= d + 12);
        case 26:
            return plain && within(2, 40);
        case 27:
            return plain && within(3, 40);
        case 28:
        case 29:
            return plain && within(6, 40);
        default:
            return false;
    }
}

int SetFormat(bool print, int handle, const char* name, int type, int decimals, int width) {
    const int refused = print ? QORA_STATUS_BAD_PRINT_FORMAT : QORA_STATUS_BAD_WRITE_FORMAT;
    return EntryCall(handle, AccessDefine, kCatchHandle, [&](FileEntry& entry) -> int {
        if (!IsAcceptedCode(type)) return refused;
        const int index = entry.FindVariable(name);
        if (index < 0) return QORA_STATUS_VAR_NOT_FOUND;
        QORA_Variable& var = entry.fpDataSource->GetVariable(index);
        if (!IsValidFormat(print, var.GetType(), type, width, decimals)) return refused;
        const QORA_Format format{type, width, decimals};
        if (print)
            var.SetPrintFormat(format);
        else
            var.SetWriteFormat(format);
        return QORA_STATUS_OK;
    });
}

int GetFormat(bool print, int handle, const char* name, int* type, int* decimals, int* width) {
    if (type == nullptr || decimals == nullptr || width == nullptr) return kCatchHandle;
    *type = kDefaultCode;
    *width = kDefaultWidth;
    *decimals = kDefaultDecimals;
    return VariableCall(handle, name, AccessAny, [&](FileEntry&, QORA_Variable& var) {
        const QORA_Format format = print ? var.GetPrintFormat() : var.GetWriteFormat();
        *width = format.width;
        *decimals = format.decimals;
        if (IsAcceptedCode(format.code)) *type = format.code;
        return QORA_STATUS_OK;
    });
}

}  // namespace

int QORA_API qoraSetVarPrintFormat(int handle, const char* name, int type, int decimals,
                                   int width) {
    return SetFormat(true, handle, name, type, decimals, width);
}

int QORA_API qoraSetVarWriteFormat(int handle, const char* name, int type, int decimals,
                                   int width) {
    return SetFormat(false, handle, name, type, decimals, width);
}

int QORA_API qoraGetVarPrintFormat(int handle, const char* name, int* type, int* decimals,
                                   int* width) {
    return GetFormat(true, handle, name, type, decimals, width);
}

int QORA_API qoraGetVarWriteFormat(int handle, const char* name, int* type, int* decimals,
                                   int* width) {
    return GetFormat(false, handle, name, type, decimals, width);
}
