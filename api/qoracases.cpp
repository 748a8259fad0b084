// The case data calls: reading cases, positioning the reader, single values
// of the current case, and the special values of the numeric model.
#include <cstring>

#include "case.h"
#include "qoracall.h"
#include "specialvalues.h"

namespace {

// The value slot a caller's variable handle names (dictionary index + 1,
// truncated toward zero), or the status that refuses it.
int ResolveVariable(const FileEntry& entry, double varHandle, const ValueSlot** slot) {
    const std::vector<ValueSlot>& slots = entry.fValueSlots;
    if (slots.empty()) return QORA_STATUS_DICT_NOT_COMMITTED;
    // Compared as a double first: NaN and handles beyond int never convert.
    if (!(varHandle >= 1.0 && varHandle < double(slots.size()) + 1.0))
        return QORA_STATUS_BAD_VAR_HANDLE;
    *slot = &slots[size_t(varHandle) - 1];
    return QORA_STATUS_OK;
}

const char* ValueAt(const FileEntry& entry, const ValueSlot& slot) {
    return reinterpret_cast<const char*>(entry.fpCaseBuffer.get()) + size_t(slot.offset) * 8;
}

// The case buffer is no longer a case while it is being filled, so a read
// that fails half-way leaves no values to fetch.
int ReadNextCase(FileEntry& entry) {
    if (entry.fCaseState == CaseAtEnd) return QORA_WARN_END_OF_FILE;
    if (!entry.fpCaseReader) return QORA_STATUS_NO_MEMORY;
    entry.fCaseState = CaseNone;
    if (!entry.fpCaseReader->ReadCase()) {
        entry.fCaseState = CaseAtEnd;
        return QORA_WARN_END_OF_FILE;
    }
    entry.fCaseState = CaseLoaded;
    return QORA_STATUS_OK;
}

}  // namespace

int QORA_API qoraReadCaseRecord(int handle) {
    return EntryCall(handle, AccessReadCases, kCatchCaseIn, ReadNextCase);
}

int QORA_API qoraWholeCaseIn(int handle, void* caseRecord) {
    return EntryCall(handle, AccessReadCases, kCatchCaseIn, [&](FileEntry& entry) {
        if (caseRecord == nullptr) return int(QORA_STATUS_READ_FAILED);
        const int status = ReadNextCase(entry);
        if (status != QORA_STATUS_OK) return status;
        std::memcpy(caseRecord, entry.fpCaseBuffer.get(),
                    size_t(entry.fpDataSource->ValueCount()) * 8);
        entry.fCaseState = CaseNone;
        return int(QORA_STATUS_OK);
    });
}

int QORA_API qoraSeekNextCase(int handle, int caseNumber) {
    return EntryCall(handle, AccessReadCases, kCatchCaseIn, [&](FileEntry& entry) {
        QORA_InputCaseIterator* reader = entry.fpCaseReader.get();
        if (!reader) return int(QORA_STATUS_NO_MEMORY);
        if (!reader->CanSeek()) return int(QORA_STATUS_READ_FAILED);
        entry.fCaseState = CaseNone;
        return reader->SeekCase(int64_t{caseNumber}) ? int(QORA_STATUS_OK)
                                                     : int(QORA_STATUS_READ_FAILED);
    });
}

int QORA_API qoraGetValueNumeric(int handle, double varHandle, double* value) {
    if (value != nullptr) *value = 0.0;
    return EntryCall(handle, AccessReadCases, kCatchCaseIn, [&](FileEntry& entry) {
        if (entry.fCaseState != CaseLoaded) return int(QORA_STATUS_NO_CURRENT_CASE);
        const ValueSlot* slot;
        const int status = ResolveVariable(entry, varHandle, &slot);
        if (status != QORA_STATUS_OK) return status;
        if (slot->width != 0) return int(QORA_STATUS_NUMERIC_REQUIRED);
        if (value == nullptr) return int(QORA_STATUS_READ_FAILED);
        std::memcpy(value, ValueAt(entry, *slot), sizeof *value);
        return int(QORA_STATUS_OK);
    });
}

int QORA_API qoraGetValueChar(int handle, double varHandle, char* value, int valueLength) {
    if (value != nullptr && valueLength > 0) value[0] = '\0';
    return EntryCall(handle, AccessReadCases, kCatchCaseIn, [&](FileEntry& entry) {
        if (entry.fCaseState != CaseLoaded) return int(QORA_STATUS_NO_CURRENT_CASE);
        const ValueSlot* slot;
        const int status = ResolveVariable(entry, varHandle, &slot);
        if (status != QORA_STATUS_OK) return status;
        if (slot->width == 0) return int(QORA_STATUS_STRING_REQUIRED);
        if (slot->width >= valueLength) return int(QORA_STATUS_BUFFER_TOO_SHORT);
        if (value == nullptr) return int(QORA_STATUS_READ_FAILED);
        std::memcpy(value, ValueAt(entry, *slot), size_t(slot->width));
        value[slot->width] = '\0';
        return int(QORA_STATUS_OK);
    });
}

double QORA_API qoraSysmisVal(void) { return SysmisValue(); }

int QORA_API qoraHostSysmisVal(double* value) {
    if (value != nullptr) *value = SysmisValue();
    return QORA_STATUS_OK;
}

int QORA_API qoraLowHighVal(double* lowest, double* highest) {
    if (lowest != nullptr) *lowest = LowestValue();
    if (highest != nullptr) *highest = HighestValue();
    return QORA_STATUS_OK;
}
