// The frame of every exported call: clear the outputs, look the handle up,
// run the body. No exception ever crosses the interface: whatever is thrown
// becomes the catch-all status of the call's family, whatever it carried.
#pragma once

#include <cstdlib>
#include <cstring>
#include <string>

#include "handletable.h"
#include "qoraio32.h"

// Marks the failing side of a check on the path of every value call, so
// that the passing path is laid out straight: a taken branch costs more
// there than the instructions around it.
#if defined(__GNUC__)
#define QORA_UNLIKELY(condition) __builtin_expect(!!(condition), 0)
#else
#define QORA_UNLIKELY(condition) (condition)
#endif

// The catch-all status of each family of calls.
enum CatchAll : int {
    kCatchCaseOut = QORA_STATUS_WRITE_FAILED,
    kCatchCaseIn = QORA_STATUS_READ_FAILED,
    kCatchCopy = QORA_STATUS_READ_FAILED,
    kCatchOpen = QORA_STATUS_BAD_FILE,
    kCatchFree = QORA_STATUS_CANNOT_FREE,
    kCatchHandle = QORA_STATUS_BAD_FILE_HANDLE,
};

// Runs body() and returns its status, or catchAll when it throws.
template <typename Body>
int GuardedCall(CatchAll catchAll, Body&& body) noexcept {
    try {
        return body();
    } catch (...) {
        return catchAll;
    }
}

// Looks the handle up with the given requirement; when it passes, runs
// body(FileEntry&) guarded, else returns the lookup's status.
template <typename Body>
int EntryCall(int handle, Access access, CatchAll catchAll, Body&& body) noexcept {
    return GuardedCall(catchAll, [&]() -> int {
        FileEntry* entry;
        const int status = TheHandleTable().Lookup(handle, access, &entry);
        return status == QORA_STATUS_OK ? body(*entry) : status;
    });
}

// EntryCall for a call that names a variable: runs body(FileEntry&,
// QORA_Variable&) when the name is in the entry's name index, else returns
// QORA_STATUS_VAR_NOT_FOUND. The catch-all is that of most calls.
template <typename Body>
int VariableCall(int handle, const char* name, Access access, Body&& body) noexcept {
    return EntryCall(handle, access, kCatchHandle, [&](FileEntry& entry) -> int {
        const int index = entry.FindVariable(name);
        if (index < 0) return QORA_STATUS_VAR_NOT_FOUND;
        return body(entry, entry.fpDataSource->GetVariable(index));
    });
}

// Memory handed to a caller comes from std::malloc and goes back through the
// matching free call. A zero-terminated copy of the bytes, or null when
// memory runs out.
inline char* CopyForCaller(const std::string& bytes) {
    char* copy = static_cast<char*>(std::malloc(bytes.size() + 1));
    if (copy != nullptr) {
        std::memcpy(copy, bytes.data(), bytes.size());
        copy[bytes.size()] = '\0';
    }
    return copy;
}

// Frees count strings (null ones skipped), then the array; a null array
// frees nothing.
inline void FreeCallerStrings(char** strings, int count) {
    if (strings == nullptr) return;
    for (int i = 0; i < count; ++i) std::free(strings[i]);
    std::free(strings);
}
