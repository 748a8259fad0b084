#include "fileentry.h"

#include <algorithm>
#include <new>

#include "qoraio32.h"

FileEntry::FileEntry(std::unique_ptr<QORA_DataSource> dataSource, OpenMode mode)
    : fpDataSource(std::move(dataSource)), fMode(mode), fCommitted(mode != WriteMode) {}

int FileEntry::Check(Access access) const {
    switch (access) {
        case AccessAny:
            break;
        case AccessDefine:
            if (fMode == ReadMode) return QORA_STATUS_OPENED_FOR_READING;
            if (fCommitted) return QORA_STATUS_DICT_COMMITTED;
            break;
        case AccessReadCases:
            if (fMode != ReadMode) return QORA_STATUS_NOT_OPENED_FOR_READING;
            break;
        case AccessWriteCases:
            if (fMode == ReadMode) return QORA_STATUS_OPENED_FOR_READING;
            if (!fCommitted) return QORA_STATUS_DICT_NOT_COMMITTED;
            break;
    }
    return QORA_STATUS_OK;
}

void FileEntry::BuildValueSlots() {
    const QORA_DataSource& source = *fpDataSource;
    fValueSlots.clear();
    fValueSlots.reserve(size_t(source.ColumnCount()));
    for (int i = 0; i < source.ColumnCount(); ++i)
        fValueSlots.push_back({source.ValueOffset(i), source.GetVariable(i).GetType()});
}

int FileEntry::OpenCaseReader() {
    const size_t units = size_t(std::max(fpDataSource->ValueCount(), 1));
    fpCaseBuffer.reset(new (std::nothrow) double[units]());
    if (!fpCaseBuffer) return QORA_STATUS_NO_MEMORY;
    fpCaseReader.reset(fpDataSource->NewIterator(fpCaseBuffer.get()));
    if (!fpCaseReader) return QORA_STATUS_NO_MEMORY;
    fCaseState = CaseNone;
    return QORA_STATUS_OK;
}
