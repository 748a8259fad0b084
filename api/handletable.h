// The process-wide table of open files: a file handle is a slot index.
#pragma once

#include <array>
#include <memory>
#include <mutex>

#include "fileentry.h"

class HandleTable {
  public:
    enum { kSlots = 100 };

    // 0 with *entry set, 5 for a handle outside 0 to 99 or an empty slot,
    // else the status of the entry's access check (*entry then stays null).
    int Lookup(int handle, Access access, FileEntry** entry) const;
    // Stores the entry in the lowest empty slot: 0 with *handle set, or 4
    // when every slot is taken (the entry is then destroyed).
    int Insert(std::unique_ptr<FileEntry> entry, int* handle);
    // Empties the slot, then destroys its entry: 0, or 5 for a bad handle.
    // The slot is free even when tearing the entry down fails.
    int Close(int handle);
    // Whether any slot holds a file.
    bool AnyOpen() const;

  private:
    std::array<std::unique_ptr<FileEntry>, kSlots> fSlots;
    // Threads that open and close files of their own at once must not take
    // one slot twice; a lookup reads only its own slot and goes unlocked.
    std::mutex fSlotsLock;
};

// The one table of the process, created when the library is loaded (in the
// order qoraload.cpp gives). Reached without a call: every call on a file,
// down to a single value, passes here.
extern HandleTable gHandleTable;
inline HandleTable& TheHandleTable() { return gHandleTable; }

// Inline: every exported call on a file passes here.
inline int HandleTable::Lookup(int handle, Access access, FileEntry** entry) const {
    *entry = nullptr;
    if (handle < 0 || handle >= kSlots || !fSlots[handle]) return QORA_STATUS_BAD_FILE_HANDLE;
    const int status = fSlots[handle]->Check(access);
    if (status == QORA_STATUS_OK) *entry = fSlots[handle].get();
    return status;
}
