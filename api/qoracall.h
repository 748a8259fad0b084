// The frame of every exported call: clear the outputs, look the handle up,
// run the body. No exception ever crosses the interface: whatever is thrown
// becomes the catch-all status of the call's family, whatever it carried.
#pragma once

#include "handletable.h"
#include "qoraio32.h"

// The catch-all status of each family of calls.
enum CatchAll : int {
    kCatchCaseOut = QORA_STATUS_WRITE_FAILED,
    kCatchCaseIn = QORA_STATUS_READ_FAILED,
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
