// The record of one open file, as the handle table keeps it.
#pragma once

#include <array>
#include <cstdint>
#include <memory>
#include <string>
#include <vector>

#include "datasrc.h"
#include "extension.h"
#include "multrespcollector.h"
#include "nameindex.h"
#include "qoraio32.h"

class QORA_InputCaseIterator;
class SystemFileDataSource;

enum OpenMode : int32_t { ReadMode = 1, WriteMode = 2, AppendMode = 3 };
enum CaseState : int32_t { CaseNone = 0, CaseLoaded = 1, CaseAtEnd = 2 };

// What a call needs of the entry before it may run.
enum Access { AccessAny, AccessDefine, AccessReadCases, AccessWriteCases };

// Where a variable's value lies in a case buffer (in 8-byte units) and its
// width (0 numeric, else the string width).
struct ValueSlot {
    int32_t offset;
    int32_t width;
};

struct FileEntry {
    FileEntry(std::unique_ptr<QORA_DataSource> dataSource, OpenMode mode);
    ~FileEntry();

    // Completes a file being written: 0, or QORA_STATUS_WRITE_FAILED when
    // the file could not be completed, so that its close reports that.
    int Finish();

    // 0 when the entry meets the requirement, else the status code.
    int Check(Access access) const;
    bool HasSystemFile() const { return fpSystemFile != nullptr; }
    // The entry's own system file view or, failing that, the data source's
    // parent when that is a system file (a transcoding source sits on one).
    SystemFileDataSource* SystemFileOrParent() const;

    // From each variable's key, in dictionary order: 0, or
    // QORA_STATUS_BAD_FILE when two variables share a key.
    int BuildNameIndex();
    // Indexes a variable appended after the build.
    void AddToNameIndex(int index);
    // The dictionary index of a name given by a caller (case and surrounding
    // blanks ignored), or -1; a null name is never found.
    int FindVariable(const char* name) const;
    void BuildValueSlots();

    // Stored extension data handed out piece by piece, per subtype 0 to 40:
    // the first read opens a reader at the start, each read hands out the
    // whole elements that fit in maxBytes, and the read that finds nothing
    // left closes the reader, so the next one starts again. Returns the
    // elements copied into buffer.
    int32_t ReadExtensionPiece(int32_t subtype, void* buffer, int32_t maxBytes);
    void CloseExtensionReader(int32_t subtype);

    enum { kReaderSlots = 41 };

    // Members are destroyed in the reverse of this order, which is the order
    // in which an entry is torn down: the extension readers first, the data
    // source and the multiple response set collector last.
    MultRespCollector fMultResp;
    std::unique_ptr<QORA_DataSource> fpDataSource;
    std::unique_ptr<double[]> fpBlankCase;  // write and append modes only
    std::unique_ptr<double[]> fpCaseBuffer;
    std::unique_ptr<QORA_InputCaseIterator> fpCaseReader;  // over the case buffer
    std::vector<ValueSlot> fValueSlots;
    NameIndex fNameIndex;

    OpenMode fMode;
    CaseState fCaseState = CaseNone;
    bool fCommitted;                               // the dictionary is final
    SystemFileDataSource* fpSystemFile = nullptr;  // the data source, when it is a system file
    std::array<std::unique_ptr<QORA_ExtensionReader>, kReaderSlots> fExtensionReaders;
};

// Inline: every exported call on a file passes here.
inline int FileEntry::Check(Access access) const {
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
