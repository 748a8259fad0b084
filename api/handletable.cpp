#include "handletable.h"

#include "qoraio32.h"

int HandleTable::Insert(std::unique_ptr<FileEntry> entry, int* handle) {
    for (int slot = 0; slot < kSlots; ++slot) {
        if (!fSlots[slot]) {
            fSlots[slot] = std::move(entry);
            *handle = slot;
            return QORA_STATUS_OK;
        }
    }
    return QORA_STATUS_TOO_MANY_FILES;
}

int HandleTable::Close(int handle) {
    FileEntry* entry;
    const int status = Lookup(handle, AccessAny, &entry);
    if (status != QORA_STATUS_OK) return status;
    // Out of the table before the teardown, so that a failure while the file
    // is finished cannot leave the slot pointing at a half-destroyed entry.
    const std::unique_ptr<FileEntry> closing = std::move(fSlots[handle]);
    return closing->Finish();
}
