// Committing the dictionary of a new file, and the properties of a file as a
// whole: compression, id string, product and release, time stamp and the
// case weight variable.
#include <cmath>
#include <cstdio>
#include <cstring>
#include <string>

#include "SystemFileDataSource.h"
#include "calendar.h"
#include "qoracall.h"

namespace {

// The text of the product string after its fixed prefix "@(#) QORA DATA FILE ".
enum { kProductPrefix = 20 };

void CopyOut(char* out, const std::string& text) {
    std::memcpy(out, text.c_str(), text.size() + 1);
}

}  // namespace

int QORA_API qoraCommitHeader(int handle) {
    return EntryCall(handle, AccessDefine, kCatchHandle, [](FileEntry& entry) -> int {
        if (entry.fpDataSource->ColumnCount() == 0) return QORA_STATUS_NO_VARIABLES;
        if (!entry.HasSystemFile()) return QORA_STATUS_NO_SYSTEM_FILE;
        entry.fMultResp.Flush(*entry.fpDataSource);
        entry.fpSystemFile->CommitDictionary();
        entry.BuildValueSlots();
        entry.fCommitted = true;
        return QORA_STATUS_OK;
    });
}

int QORA_API qoraSetCompression(int handle, int compSwitch) {
    return EntryCall(handle, AccessDefine, kCatchHandle, [&](FileEntry& entry) -> int {
        if (!entry.HasSystemFile()) return QORA_STATUS_NO_SYSTEM_FILE;
        entry.fpSystemFile->SetCompression(compSwitch != 0);
        return QORA_STATUS_OK;
    });
}

int QORA_API qoraGetCompression(int handle, int* compSwitch) {
    if (compSwitch == nullptr) return kCatchHandle;
    *compSwitch = 1;
    return EntryCall(handle, AccessAny, kCatchHandle, [&](FileEntry& entry) {
        if (const SystemFileDataSource* file = entry.SystemFileOrParent())
            *compSwitch = file->Settings().fCompressed ? 1 : 0;
        return QORA_STATUS_OK;
    });
}

int QORA_API qoraSetIdString(int handle, const char* id) {
    return EntryCall(handle, AccessDefine, kCatchHandle, [&](FileEntry& entry) {
        entry.fpDataSource->SetIdString(id);
        return QORA_STATUS_OK;
    });
}

int QORA_API qoraGetIdString(int handle, char* id) {
    if (id == nullptr) return kCatchHandle;
    id[0] = '\0';
    return EntryCall(handle, AccessAny, kCatchHandle, [&](FileEntry& entry) -> int {
        const char* text = entry.fpDataSource->GetIdString();
        if (text == nullptr) return QORA_STATUS_BAD_FILE_HANDLE;
        CopyOut(id, text);
        return QORA_STATUS_OK;
    });
}

int QORA_API qoraGetSystemString(int handle, char* text) {
    if (text == nullptr) return kCatchHandle;
    text[0] = '\0';
    return EntryCall(handle, AccessAny, kCatchHandle, [&](FileEntry& entry) -> int {
        const SystemFileDataSource* file = entry.SystemFileOrParent();
        if (file == nullptr) return QORA_STATUS_NO_SYSTEM_FILE;
        const std::string& product = file->Settings().fProduct;
        if (product.size() >= kProductPrefix) CopyOut(text, product.substr(kProductPrefix));
        return QORA_STATUS_OK;
    });
}

int QORA_API qoraGetReleaseInfo(int handle, int* relInfo) {
    if (relInfo == nullptr) return kCatchHandle;
    relInfo[0] = relInfo[1] = relInfo[2] = 0;
    return EntryCall(handle, AccessAny, kCatchHandle, [&](FileEntry& entry) -> int {
        if (entry.fMode == WriteMode) return QORA_STATUS_OK;
        const SystemFileDataSource* file = entry.SystemFileOrParent();
        if (file == nullptr) return QORA_STATUS_NO_RELEASE_INFO;
        return file->GetReleaseInfo(&relInfo[0], &relInfo[1], &relInfo[2])
                   ? QORA_STATUS_OK
                   : QORA_STATUS_NO_RELEASE_INFO;
    });
}

int QORA_API qoraGetTimeStamp(int handle, char* fileDate, char* fileTime) {
    if (fileDate == nullptr || fileTime == nullptr) return kCatchHandle;
    fileDate[0] = fileTime[0] = '\0';
    return EntryCall(handle, AccessAny, kCatchHandle, [&](FileEntry& entry) -> int {
        const double stamp = entry.fpDataSource->GetTimeStamp();
        int day, month, year;
        const double midnight = std::floor(stamp * 1.1574074074074073e-5) * 86400.0;
        if (const int status = qoraConvertQORADate(&day, &month, &year, midnight)) return status;
        int days, hours, minutes;
        double seconds;
        const double ofDay = std::floor(std::fmod(stamp, 86400.0));
        if (const int status = qoraConvertQORATime(&days, &hours, &minutes, &seconds, ofDay))
            return status;
        // The conversions succeeded, so every field has its two digits.
        std::snprintf(fileDate, 10, "%02u-%s-%02u", unsigned(day) % 100, MonthAbbreviation(month),
                      unsigned(year) % 100);
        std::snprintf(fileTime, 9, "%02u:%02u:%02u", unsigned(hours) % 100, unsigned(minutes) % 100,
                      unsigned(seconds) % 100);
        return QORA_STATUS_OK;
    });
}

int QORA_API qoraSetCaseWeightVar(int handle, const char* varName) {
    return EntryCall(handle, AccessDefine, kCatchHandle, [&](FileEntry& entry) -> int {
        const int index = entry.FindVariable(varName);
        if (index < 0) return QORA_STATUS_VAR_NOT_FOUND;
        if (entry.fpDataSource->GetVariable(index).IsString()) return QORA_STATUS_NUMERIC_REQUIRED;
        entry.fpDataSource->SetCaseWeight(index);
        return QORA_STATUS_OK;
    });
}

int QORA_API qoraGetCaseWeightVar(int handle, char* varName) {
    if (varName == nullptr) return kCatchHandle;
    varName[0] = '\0';
    return EntryCall(handle, AccessAny, kCatchHandle, [&](FileEntry& entry) -> int {
        const int index = entry.fpDataSource->GetCaseWeight();
        if (index < 0) return QORA_WARN_NO_WEIGHT;
        CopyOut(varName, entry.fpDataSource->GetVariable(index).GetName());
        return QORA_STATUS_OK;
    });
}

// Temporary files go where the platform puts them.
int QORA_API qoraSetTempDir(const char*) { return QORA_STATUS_OK; }
