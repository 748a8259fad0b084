#include "fileentry.h"

#include <cstring>

#include "SystemFileDataSource.h"
#include "case.h"
#include "qoraio32.h"
#include "variable.h"

FileEntry::FileEntry(std::unique_ptr<QORA_DataSource> dataSource, OpenMode mode)
    : fpDataSource(std::move(dataSource)),
      fMode(mode),
      fCommitted(mode != WriteMode),
      fpSystemFile(dynamic_cast<SystemFileDataSource*>(fpDataSource.get())) {
    if (!fpDataSource) return;
    fMultResp.Reload(*fpDataSource);
    if (fCommitted) BuildValueSlots();
}

// A file being written is completed on disk before anything else goes.
FileEntry::~FileEntry() { Finish(); }

int FileEntry::Finish() {
    if (fpSystemFile == nullptr || fMode == ReadMode) return QORA_STATUS_OK;
    try {
        fpSystemFile->FinishWriting();
    } catch (...) {
        // The writer has done what it could; the slot is freed regardless.
        return QORA_STATUS_WRITE_FAILED;
    }
    return QORA_STATUS_OK;
}

SystemFileDataSource* FileEntry::SystemFileOrParent() const {
    if (fpSystemFile || !fpDataSource) return fpSystemFile;
    return dynamic_cast<SystemFileDataSource*>(fpDataSource->GetParent());
}

int FileEntry::BuildNameIndex() {
    fNameIndex.Reset(size_t(fpDataSource->ColumnCount()));
    for (int i = 0; i < fpDataSource->ColumnCount(); ++i) {
        if (!fNameIndex.Insert(fpDataSource->GetVariable(i).GetKey(), i))
            return QORA_STATUS_BAD_FILE;
    }
    return QORA_STATUS_OK;
}

void FileEntry::AddToNameIndex(int index) {
    fNameIndex.Insert(fpDataSource->GetVariable(index).GetKey(), index);
}

int FileEntry::FindVariable(const char* name) const {
    if (name == nullptr) return -1;
    while (*name == ' ') ++name;
    // The same key a variable makes of its own name, so both sides agree.
    const int index = fNameIndex.Find(MakeLookupKey(name, std::strlen(name)));
    return fpDataSource->IsValidIndex(index) ? index : -1;
}

void FileEntry::BuildValueSlots() {
    const QORA_DataSource& source = *fpDataSource;
    std::vector<ValueSlot> slots;
    slots.reserve(static_cast<size_t>(source.ColumnCount()));
    for (int i = 0; i < source.ColumnCount(); ++i)
        slots.push_back({source.ValueOffset(i), source.GetVariable(i).GetType()});
    fValueSlots = std::move(slots);
}

int32_t FileEntry::ReadExtensionPiece(int32_t subtype, void* buffer, int32_t maxBytes) {
    QORA_ASSERT(0 <= subtype && subtype < kReaderSlots);
    auto& reader = fExtensionReaders[size_t(subtype)];
    if (!reader)
        reader = std::make_unique<QORA_ExtensionReader>(fpDataSource->GetExtension(subtype));
    if (reader->Position() >= reader->ElementCount()) {
        reader.reset();
        return 0;
    }
    return reader->Read(buffer, maxBytes);
}

void FileEntry::CloseExtensionReader(int32_t subtype) {
    QORA_ASSERT(0 <= subtype && subtype < kReaderSlots);
    fExtensionReaders[size_t(subtype)].reset();
}
