#include "fileentry.h"

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
