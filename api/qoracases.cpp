// The case data calls: reading cases, positioning the reader, single values
// of the current case, and the special values of the numeric model.
#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <new>

#include "SystemFileDataSource.h"
#include "case.h"
#include "qoracall.h"
#include "specialvalues.h"

namespace {

// The value slot a caller's variable handle names (dictionary index + 1,
// truncated toward zero), or the status that refuses it.
int ResolveVariable(const FileEntry& entry, double varHandle, const ValueSlot** slot) {
    const std::vector<ValueSlot>& slots = entry.fValueSlots;
    // Bounded as a double first: NaN and handles beyond int never convert.
    // The index is then checked against the table as an integer, which
    // spares converting the table's size on every call. No handle passes an
    // empty table, which is told apart only then.
    const bool inInt = varHandle >= 1.0 && varHandle < double(INT32_MAX) + 1.0;
    const uint32_t index = inInt ? uint32_t(int32_t(varHandle)) - 1 : UINT32_MAX;
    if (QORA_UNLIKELY(index >= slots.size()))
        return slots.empty() ? QORA_STATUS_DICT_NOT_COMMITTED : QORA_STATUS_BAD_VAR_HANDLE;
    *slot = &slots[index];
    return QORA_STATUS_OK;
}

char* ValueAt(const FileEntry& entry, const ValueSlot& slot) {
    return reinterpret_cast<char*>(entry.fpCaseBuffer.get()) + size_t(slot.offset) * 8;
}

// Starts a case from the blank case, made once per entry.
int StartCase(FileEntry& entry) {
    const size_t bytes = 8 * size_t(entry.fpDataSource->ValueCount());
    if (!entry.fpCaseBuffer) {
        const size_t units = std::max<size_t>(bytes / 8, 1);
        entry.fpCaseBuffer.reset(new (std::nothrow) double[units]);
        entry.fpBlankCase.reset(new (std::nothrow) double[units]);
        if (!entry.fpCaseBuffer || !entry.fpBlankCase) {
            entry.fpCaseBuffer.reset();
            return QORA_STATUS_NO_MEMORY;
        }
        entry.fpDataSource->ClearValues(entry.fpBlankCase.get(), 0,
                                        entry.fpDataSource->ColumnCount());
        entry.fCaseState = CaseNone;
    }
    std::memcpy(entry.fpCaseBuffer.get(), entry.fpBlankCase.get(), bytes);
    entry.fCaseState = CaseLoaded;
    return QORA_STATUS_OK;
}

// Makes sure a case is under construction. On a writing handle only
// StartCase makes one, after the buffers, so a loaded case needs nothing
// more; the test is all that stays in the calls that set values.
inline int PrepareCaseOutput(FileEntry& entry) {
    return entry.fCaseState == CaseLoaded ? int(QORA_STATUS_OK) : StartCase(entry);
}

// Prepares the case and resolves the variable: the value's place, or a status.
int OutputSlot(FileEntry& entry, double varHandle, const ValueSlot** slot) {
    if (const int status = PrepareCaseOutput(entry)) return status;
    return ResolveVariable(entry, varHandle, slot);
}

// Hands a whole case in the file's layout to the data source.
int WriteWholeCase(FileEntry& entry, const void* units) {
    if (units == nullptr || !entry.HasSystemFile()) return QORA_STATUS_WRITE_FAILED;
    entry.fpSystemFile->WriteCase(units);
    entry.fCaseState = CaseNone;
    return QORA_STATUS_OK;
}

// Reads the next case into the case buffer, or straight into a whole case
// record. The case buffer is no longer a case while it is being filled, so
// a read that fails half-way leaves no values to fetch.
int ReadNextCase(FileEntry& entry, void* record) {
    if (entry.fCaseState == CaseAtEnd) return QORA_WARN_END_OF_FILE;
    QORA_InputCaseIterator* reader = entry.fpCaseReader.get();
    if (!reader) return QORA_STATUS_NO_MEMORY;
    entry.fCaseState = CaseNone;
    if (!(record ? reader->ReadCaseInto(record) : reader->ReadCase())) {
        entry.fCaseState = CaseAtEnd;
        return QORA_WARN_END_OF_FILE;
    }
    entry.fCaseState = record ? CaseNone : CaseLoaded;
    return QORA_STATUS_OK;
}

}  // namespace

int QORA_API qoraReadCaseRecord(int handle) {
    return EntryCall(handle, AccessReadCases, kCatchCaseIn,
                     [](FileEntry& entry) { return ReadNextCase(entry, nullptr); });
}

// The case goes to the caller's record without a stop in the case buffer;
// no value of it can be fetched afterwards either way.
int QORA_API qoraWholeCaseIn(int handle, void* caseRecord) {
    return EntryCall(handle, AccessReadCases, kCatchCaseIn, [&](FileEntry& entry) {
        if (caseRecord == nullptr) return int(QORA_STATUS_READ_FAILED);
        return ReadNextCase(entry, caseRecord);
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

// The value is cleared only when the call fails, which spares the store
// and its test in the loop of a caller fetching every value of a case.
int QORA_API qoraGetValueNumeric(int handle, double varHandle, double* value) {
    const int status = EntryCall(handle, AccessReadCases, kCatchCaseIn, [&](FileEntry& entry) {
        if (entry.fCaseState != CaseLoaded) return int(QORA_STATUS_NO_CURRENT_CASE);
        const ValueSlot* slot;
        const int status = ResolveVariable(entry, varHandle, &slot);
        if (status != QORA_STATUS_OK) return status;
        if (slot->width != 0) return int(QORA_STATUS_NUMERIC_REQUIRED);
        if (value == nullptr) return int(QORA_STATUS_READ_FAILED);
        std::memcpy(value, ValueAt(entry, *slot), sizeof *value);
        return int(QORA_STATUS_OK);
    });
    if (status != QORA_STATUS_OK && value != nullptr) *value = 0.0;
    return status;
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

int QORA_API qoraSetValueNumeric(int handle, double varHandle, double value) {
    return EntryCall(handle, AccessWriteCases, kCatchCaseOut, [&](FileEntry& entry) -> int {
        const ValueSlot* slot;
        if (const int status = OutputSlot(entry, varHandle, &slot)) return status;
        if (slot->width != 0) return QORA_STATUS_NUMERIC_REQUIRED;
        std::memcpy(ValueAt(entry, *slot), &value, sizeof value);
        return QORA_STATUS_OK;
    });
}

int QORA_API qoraSetValueChar(int handle, double varHandle, const char* value) {
    return EntryCall(handle, AccessWriteCases, kCatchCaseOut, [&](FileEntry& entry) -> int {
        const ValueSlot* slot;
        if (const int status = OutputSlot(entry, varHandle, &slot)) return status;
        if (slot->width == 0) return QORA_STATUS_STRING_REQUIRED;
        if (value == nullptr) return QORA_STATUS_WRITE_FAILED;
        const size_t length = std::strlen(value);
        if (length > size_t(slot->width)) return QORA_STATUS_STRING_TOO_LONG;
        char* out = ValueAt(entry, *slot);
        std::memcpy(out, value, length);
        std::memset(out + length, ' ', size_t(slot->width) - length);
        return QORA_STATUS_OK;
    });
}

// A case on which no value was set is written as the blank case.
int QORA_API qoraCommitCaseRecord(int handle) {
    return EntryCall(handle, AccessWriteCases, kCatchCaseOut, [](FileEntry& entry) -> int {
        if (const int status = PrepareCaseOutput(entry)) return status;
        return WriteWholeCase(entry, entry.fpCaseBuffer.get());
    });
}

// A case being built value by value is dropped.
int QORA_API qoraWholeCaseOut(int handle, const void* caseRecord) {
    return EntryCall(handle, AccessWriteCases, kCatchCaseOut,
                     [&](FileEntry& entry) { return WriteWholeCase(entry, caseRecord); });
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
