#include "handletable.h"

#include "qoraio32.h"

int HandleTable::Insert(std::unique_ptr<FileEntry> entry, int* handle) {
    const std::lock_guard<std::mutex> guard(fSlotsLock);
    for (int slot = 0; slot < kSlots; ++slot) {
        if (!fSlots[slot]) {
            fSlots[slot] = std::move(entry);
            *handle = slot;
            return QORA_STATUS_OK;
        }
    }
    return QORA_STATUS_TOO_MANY_FILES;
}

bool HandleTable::AnyOpen() const {
    for (const auto& slot : fSlots)
        if (slot) return true;
    return false;
}

int HandleTable::Close(int handle) {
    std::unique_ptr<FileEntry> closing;
    {
        const std::lock_guard<std::mutex> guard(fSlotsLock);
        FileEntry* entry;
        const int status = Lookup(handle, AccessAny, &entry);
        if (status != QORA_STATUS_OK) return status;
        // Out of the table before the teardown, so that a failure while the
        // file is finished cannot leave the slot pointing at a half-destroyed
        // entry; the teardown runs unlocked.
        closing = std::move(fSlots[handle]);
    }
    return closing->Finish();
}
