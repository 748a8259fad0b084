// Stored extension data: the raw calls on the subtypes the library leaves to
// callers, the inventory of the records a file held, and the calls built on
// the raw ones (documents, text info, the KIV data and its identifier).
#include <cstdint>
#include <cstring>
#include <string>

#include "SystemFileDataSource.h"
#include "extension.h"
#include "qoracall.h"

namespace {

enum { kTextInfoBytes = 255, kKIVIdBytes = 256 };

// Records a file holds at most this many bytes of, so that a size always
// fits the 32-bit counts of a record.
bool IsStorableSize(int64_t elementSize, int64_t count) {
    return elementSize >= 0 && count >= 0 && elementSize * count <= INT32_MAX;
}

// The subtypes a caller may read and write: 0 to 40 but those that the
// library's own record handlers keep (9 and 22 among them, though no handler
// is registered for them).
bool IsCallerSubtype(int subtype) {
    switch (subtype) {
        case kDocumentExtension:
        case kIntegerInfoExtension:
        case kFloatInfoExtension:
        case kDateInfoExtension:
        case 9:
        case kDisplayExtension:
        case kLongNamesExtension:
        case kVeryLongStringsExtension:
        case kCaseCountExtension:
        case kFileAttributesExtension:
        case kVariableAttributesExtension:
        case kEncodingExtension:
        case kLongValueLabelsExtension:
        case 22:
            return false;
        default:
            return 0 <= subtype && subtype < FileEntry::kReaderSlots;
    }
}

int StoreText(int handle, int subtype, const char* text) {
    const int length = text ? int(std::strlen(text)) : 0;
    return qoraSetExtensionData(handle, subtype, 1, length, text);
}

// Reads the record of the subtype from its start into text, at most maxBytes
// bytes, terminates them and closes the reader again.
int ReadText(int handle, int subtype, char* text, int maxBytes) {
    if (text == nullptr) return kCatchCaseIn;
    text[0] = '\0';
    return EntryCall(handle, AccessAny, kCatchCaseIn, [&](FileEntry& entry) -> int {
        if (entry.fMode == WriteMode) return QORA_STATUS_NOT_OPENED_FOR_READING;
        const int32_t size = entry.fpDataSource->GetExtension(subtype).Impl()->ElementSize();
        entry.CloseExtensionReader(subtype);
        const int32_t n = entry.ReadExtensionPiece(subtype, text, maxBytes);
        entry.CloseExtensionReader(subtype);
        text[n * size] = '\0';
        return QORA_STATUS_OK;
    });
}

// The KIV data may be read only from a file of its own in the machine's
// byte order.
bool HasKIVData(const FileEntry& entry) {
    return entry.fpDataSource->HasExtension(kKIVExtension) && entry.HasSystemFile() &&
           !entry.fpSystemFile->IsSwapped();
}

}  // namespace

int QORA_API qoraSetExtensionData(int handle, int subType, int elementSize, int count,
                                  const void* data) {
    if (!IsCallerSubtype(subType)) return QORA_STATUS_BAD_EXTENSION;
    return EntryCall(handle, AccessAny, kCatchHandle, [&](FileEntry& entry) -> int {
        if (!IsStorableSize(elementSize, count)) return QORA_STATUS_BAD_EXTENSION;
        const bool store = count != 0 && data != nullptr;
        entry.fpDataSource->SetExtensionContent(subType, elementSize, store ? count : 0,
                                                store ? data : nullptr);
        if (subType == kMultRespExtension || subType == kExtendedMultRespExtension)
            entry.fMultResp.Reload(*entry.fpDataSource);
        return QORA_STATUS_OK;
    });
}

int QORA_API qoraGetExtensionDataDesc(int handle, int subType, int* elementSize, int* count) {
    if (elementSize == nullptr || count == nullptr) return kCatchCaseIn;
    *elementSize = 0;
    *count = 0;
    if (!IsCallerSubtype(subType)) return QORA_STATUS_BAD_EXTENSION;
    return EntryCall(handle, AccessAny, kCatchCaseIn, [&](FileEntry& entry) -> int {
        if (entry.fMode == WriteMode) return QORA_STATUS_NOT_OPENED_FOR_READING;
        if (!entry.fpDataSource->HasExtension(subType)) return QORA_STATUS_OK;
        const QORA_ExtensionImpl& record = *entry.fpDataSource->GetExtension(subType).Impl();
        *elementSize = record.ElementSize();
        *count = record.ElementCount();
        return QORA_STATUS_OK;
    });
}

int QORA_API qoraGetExtensionData(int handle, int subType, int bufferSize, int* count,
                                  void* buffer) {
    if (count == nullptr) return kCatchCaseIn;
    *count = 0;
    if (!IsCallerSubtype(subType)) return QORA_STATUS_BAD_EXTENSION;
    return EntryCall(handle, AccessAny, kCatchCaseIn, [&](FileEntry& entry) -> int {
        if (entry.fMode == WriteMode) return QORA_STATUS_NOT_OPENED_FOR_READING;
        if (buffer == nullptr && bufferSize > 0) return kCatchCaseIn;
        *count = entry.ReadExtensionPiece(subType, buffer, bufferSize);
        return QORA_STATUS_OK;
    });
}

int QORA_API qoraQueryType7(int handle, int subType, int* present) {
    if (present == nullptr) return kCatchHandle;
    *present = 0;
    return EntryCall(handle, AccessAny, kCatchHandle, [&](FileEntry& entry) -> int {
        if (entry.fMode == WriteMode) return QORA_STATUS_NOT_OPENED_FOR_READING;
        if (subType < 0 || subType >= FileEntry::kReaderSlots) return QORA_STATUS_BAD_SUBTYPE;
        const SystemFileDataSource* file = entry.SystemFileOrParent();
        if (file == nullptr) return QORA_STATUS_NO_SYSTEM_FILE;
        *present = file->HasExtensionRecord(subType) ? 1 : 0;
        return QORA_STATUS_OK;
    });
}

int QORA_API qoraCopyDocuments(int fromHandle, int toHandle) {
    return EntryCall(fromHandle, AccessAny, kCatchHandle, [&](FileEntry& from) {
        return EntryCall(toHandle, AccessDefine, kCatchHandle, [&](FileEntry& to) {
            // Shared until one side changes it.
            to.fpDataSource->SetExtension(kDocumentExtension,
                                          from.fpDataSource->GetExtension(kDocumentExtension));
            return QORA_STATUS_OK;
        });
    });
}

int QORA_API qoraSetTextInfo(int handle, const char* text) {
    return StoreText(handle, kTextInfoExtension, text);
}

int QORA_API qoraGetTextInfo(int handle, char* text) {
    return ReadText(handle, kTextInfoExtension, text, kTextInfoBytes);
}

int QORA_API qoraSetKIVGUID(int handle, const char* text) {
    return StoreText(handle, kKIVIdExtension, text);
}

int QORA_API qoraGetKIVGUID(int handle, char* text) {
    return ReadText(handle, kKIVIdExtension, text, kKIVIdBytes);
}

int QORA_API qoraGetKIVInfo(int handle, int* length, int* lastWord) {
    if (length == nullptr || lastWord == nullptr) return kCatchCaseIn;
    *length = 0;
    *lastWord = 0;
    return EntryCall(handle, AccessAny, kCatchCaseIn, [&](FileEntry& entry) -> int {
        if (entry.fMode == WriteMode) return QORA_STATUS_NOT_OPENED_FOR_READING;
        if (!HasKIVData(entry)) return QORA_WARN_NO_KIV_INFO;
        *length = entry.fpDataSource->GetExtension(kKIVExtension).Impl()->ElementCount();
        *lastWord = entry.fpDataSource->LastIntegerOfExtension(kKIVExtension);
        return QORA_STATUS_OK;
    });
}

int QORA_API qoraSetKIVFirst(int handle, const void* data, int length) {
    return qoraSetExtensionData(handle, kKIVExtension, 1, length, data);
}

// Appends bytes whatever the element size of the stored data: a record of
// larger elements (as a file may bring) is rebuilt as bytes first.
int QORA_API qoraSetKIVNext(int handle, const void* data, int length) {
    return EntryCall(handle, AccessDefine, kCatchHandle, [&](FileEntry& entry) -> int {
        if (!IsStorableSize(1, length)) return QORA_STATUS_BAD_EXTENSION;
        if (data == nullptr || length == 0) return QORA_STATUS_OK;
        QORA_DataSource& source = *entry.fpDataSource;
        // The stored record's handle is let go before appending, so that the
        // append need not copy a record it still shares.
        const int64_t stored = source.GetExtension(kKIVExtension).Impl()->Content().size();
        if (!IsStorableSize(1, stored + length)) return QORA_STATUS_BAD_EXTENSION;
        if (source.HasExtension(kKIVExtension) &&
            source.GetExtension(kKIVExtension).Impl()->ElementSize() == 1) {
            source.AppendExtensionData(kKIVExtension, length, data);
            return QORA_STATUS_OK;
        }
        std::string bytes = source.GetExtension(kKIVExtension).Impl()->Content();
        bytes.append(static_cast<const char*>(data), size_t(length));
        source.SetExtensionContent(kKIVExtension, 1, int32_t(bytes.size()), bytes.data());
        return QORA_STATUS_OK;
    });
}

int QORA_API qoraGetKIVFirst(int handle, void* data, int maxData, int* length) {
    if (length == nullptr) return kCatchCaseIn;
    *length = 0;
    return EntryCall(handle, AccessAny, kCatchCaseIn, [&](FileEntry& entry) -> int {
        if (entry.fMode == WriteMode) return QORA_STATUS_NOT_OPENED_FOR_READING;
        if (!HasKIVData(entry)) return QORA_WARN_NO_KIV_INFO;
        if (data == nullptr && maxData > 0) return kCatchCaseIn;
        const int32_t size = entry.fpDataSource->GetExtension(kKIVExtension).Impl()->ElementSize();
        entry.CloseExtensionReader(kKIVExtension);
        *length = entry.ReadExtensionPiece(kKIVExtension, data, maxData) * size;
        return QORA_STATUS_OK;
    });
}

int QORA_API qoraGetKIVNext(int handle, void* data, int maxData, int* length) {
    return qoraGetExtensionData(handle, kKIVExtension, maxData, length, data);
}
