// Opening, closing and the counts of an open file.
#include <climits>
#include <cstdint>
#include <memory>
#include <new>

#include "SystemFileDataSource.h"
#include "accessprobe.h"
#include "case.h"
#include "codepage.h"
#include "qoracall.h"

namespace {

const char kWriterProduct[] = "@(#) QORA DATA FILE MS Windows Release 16.0 qoraio32.dll";

std::unique_ptr<QORA_DataSource> NewDataSource(OpenMode mode, const char* fileName) {
    if (mode != WriteMode) return OpenForReading(fileName, nullptr);
    auto source = std::make_unique<SystemFileDataSource>();
    source->SetFileName(fileName);
    // Its text comes from the caller, in the interface encoding.
    source->Settings().fEncodingName = InterfaceEncodingName();
    return source;
}

// Makes the entry of a new open file and gives it the lowest free slot:
// 0 with *handle set, else the status (*handle stays -1).
int AllocateSlot(OpenMode mode, const char* fileName, int* handle) {
    *handle = -1;
    std::unique_ptr<QORA_DataSource> source = NewDataSource(mode, fileName);
    std::unique_ptr<FileEntry> entry(new (std::nothrow) FileEntry(std::move(source), mode));
    if (!entry) return QORA_STATUS_CANNOT_OPEN;
    if (mode == AppendMode && (!entry->HasSystemFile() || entry->fpSystemFile->IsSwapped()))
        return QORA_STATUS_CANNOT_APPEND;
    return TheHandleTable().Insert(std::move(entry), handle);
}

// Allocates a slot and readies it with prepare(slot): 0 with *handle set,
// else the status, with the slot closed again.
template <typename Prepare>
int OpenSlot(OpenMode mode, const char* fileName, int* handle, Prepare prepare) {
    int slot;
    if (const int status = AllocateSlot(mode, fileName, &slot)) return status;
    if (const int status = prepare(slot)) {
        TheHandleTable().Close(slot);
        return status;
    }
    *handle = slot;
    return QORA_STATUS_OK;
}

// Closes a handle at the end of the scope unless it was handed out.
class SlotGuard {
  public:
    SlotGuard() = default;
    SlotGuard(const SlotGuard&) = delete;
    SlotGuard& operator=(const SlotGuard&) = delete;
    ~SlotGuard() {
        if (fHandle >= 0) TheHandleTable().Close(fHandle);
    }
    int* out() { return &fHandle; }
    FileEntry& Entry(Access access) const {
        FileEntry* entry = nullptr;
        TheHandleTable().Lookup(fHandle, access, &entry);
        QORA_ASSERT(entry != nullptr);
        return *entry;
    }
    int Release() {
        const int handle = fHandle;
        fHandle = -1;
        return handle;
    }

  private:
    int fHandle = -1;
};

// What a read entry needs beyond its data source: the name index, the case
// buffer and the case reader over it.
int PrepareForReading(int handle) {
    return EntryCall(handle, AccessAny, kCatchOpen, [](FileEntry& entry) -> int {
        if (const int status = entry.BuildNameIndex()) return status;
        QORA_DataSource& source = *entry.fpDataSource;
        entry.fpCaseBuffer.reset(new (std::nothrow) double[size_t(source.ValueCount())]);
        if (!entry.fpCaseBuffer) return QORA_STATUS_NO_MEMORY;
        entry.fpCaseReader.reset(source.NewIterator(entry.fpCaseBuffer.get()));
        if (!entry.fpCaseReader) return QORA_STATUS_NO_MEMORY;
        return QORA_STATUS_OK;
    });
}

int CloseAnyMode(int handle) {
    return GuardedCall(kCatchHandle, [&] { return TheHandleTable().Close(handle); });
}

int CaseCountOf(int handle, int* count) {
    if (count == nullptr) return kCatchHandle;
    *count = -1;
    return EntryCall(handle, AccessAny, kCatchHandle, [&](FileEntry& entry) -> int {
        if (entry.fMode == WriteMode) return QORA_STATUS_NOT_OPENED_FOR_READING;
        const int64_t cases = entry.fpDataSource->CaseCount();
        // Every negative count means "unknown", which callers know as -1.
        *count = cases < 0 || cases > INT32_MAX ? -1 : static_cast<int>(cases);
        return QORA_STATUS_OK;
    });
}

}  // namespace

int QORA_API qoraOpenRead(const char* fileName, int* handle) {
    if (handle == nullptr) return kCatchOpen;
    *handle = -1;
    return GuardedCall(kCatchOpen, [&]() -> int {
        if (fileName == nullptr) return QORA_STATUS_BAD_FILE;
        return OpenSlot(ReadMode, fileName, handle, PrepareForReading);
    });
}

int QORA_API qoraOpenWrite(const char* fileName, int* handle) {
    if (handle == nullptr) return kCatchOpen;
    *handle = -1;
    return GuardedCall(kCatchOpen, [&]() -> int {
        if (AccessProbe(fileName, kProbeWrite) != QORA_STATUS_OK) return QORA_STATUS_CANNOT_OPEN;
        int slot;
        if (GuardedCall(kCatchOpen, [&] { return AllocateSlot(WriteMode, fileName, &slot); }))
            return QORA_STATUS_CANNOT_OPEN;
        const int status = EntryCall(slot, AccessDefine, kCatchOpen, [](FileEntry& entry) {
            entry.fpSystemFile->Settings().fProduct = kWriterProduct;
            return QORA_STATUS_OK;
        });
        if (status != QORA_STATUS_OK) {
            TheHandleTable().Close(slot);
            return status;
        }
        *handle = slot;
        return QORA_STATUS_OK;
    });
}

// The temporary read handle and, on failure, the new write handle are closed
// whatever happens, an exception included. Nothing was written at fileName,
// so nothing there is removed.
int QORA_API qoraOpenWriteCopy(const char* fileName, const char* dictFileName, int* handle) {
    if (handle == nullptr) return kCatchCopy;
    *handle = -1;
    return GuardedCall(kCatchCopy, [&]() -> int {
        if (AccessProbe(dictFileName, kProbeRead) != QORA_STATUS_OK) return QORA_STATUS_CANNOT_OPEN;
        SlotGuard dictionary;
        if (const int status = AllocateSlot(ReadMode, dictFileName, dictionary.out()))
            return status;
        const FileEntry& source = dictionary.Entry(AccessAny);
        if (AccessProbe(fileName, kProbeWrite) != QORA_STATUS_OK) return QORA_STATUS_CANNOT_OPEN;
        SlotGuard copy;
        if (const int status = AllocateSlot(WriteMode, fileName, copy.out())) return status;
        FileEntry& target = copy.Entry(AccessDefine);
        target.fpDataSource->AssignFrom(*source.fpDataSource);
        target.fpDataSource->SetFileName(fileName);
        // The sets are the copied dictionary's; sets added later join them.
        target.fMultResp.Reload(*target.fpDataSource);
        if (const int status = target.BuildNameIndex()) return status;
        *handle = copy.Release();
        return QORA_STATUS_OK;
    });
}

int QORA_API qoraOpenAppend(const char* fileName, int* handle) {
    if (handle == nullptr) return kCatchOpen;
    *handle = -1;
    return GuardedCall(kCatchOpen, [&]() -> int {
        if (AccessProbe(fileName, kProbeAppend) != QORA_STATUS_OK) return QORA_STATUS_CANNOT_OPEN;
        return OpenSlot(AppendMode, fileName, handle, [](int slot) {
            return EntryCall(slot, AccessAny, kCatchOpen,
                             [](FileEntry& entry) { return entry.BuildNameIndex(); });
        });
    });
}

int QORA_API qoraCloseRead(int handle) { return CloseAnyMode(handle); }
int QORA_API qoraCloseWrite(int handle) { return CloseAnyMode(handle); }
int QORA_API qoraCloseAppend(int handle) { return CloseAnyMode(handle); }

int QORA_API qoraGetNumberofVariables(int handle, int* count) {
    if (count == nullptr) return kCatchHandle;
    *count = 0;
    return EntryCall(handle, AccessAny, kCatchHandle, [&](FileEntry& entry) {
        *count = entry.fpDataSource->ColumnCount();
        return QORA_STATUS_OK;
    });
}

int QORA_API qoraGetNumberofCases(int handle, int* count) { return CaseCountOf(handle, count); }
int QORA_API qoraGetEstimatedNofCases(int handle, int* count) { return CaseCountOf(handle, count); }

int QORA_API qoraGetCaseSize(int handle, int* size) {
    if (size == nullptr) return kCatchHandle;
    *size = 0;
    return EntryCall(handle, AccessAny, kCatchHandle, [&](FileEntry& entry) -> int {
        if (!entry.fCommitted) return QORA_STATUS_DICT_NOT_COMMITTED;
        const int units = entry.fpDataSource->ValueCount();
        if (units <= 0x0FFFFFFF) *size = units * 8;
        return QORA_STATUS_OK;
    });
}
