// The record of one open file, as the handle table keeps it.
#pragma once

#include <cstdint>
#include <map>
#include <memory>
#include <string>
#include <vector>

#include "case.h"
#include "datasrc.h"

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

// Normalised name (compared as unsigned bytes) to dictionary index.
using NameIndex = std::map<std::string, int32_t>;

struct FileEntry {
    FileEntry(std::unique_ptr<QORA_DataSource> dataSource, OpenMode mode);

    // 0 when the entry meets the requirement, else the status code.
    int Check(Access access) const;
    bool HasSystemFile() const { return fpSystemFile != nullptr; }

    // Filled from the dictionary model once the file is open or committed:
    // the build of both tables comes with the dictionary reader.
    int BuildNameIndex();  // 0, or QORA_STATUS_BAD_FILE on a duplicate key
    void BuildValueSlots();
    // Allocates the case buffer and makes the case reader over it: 0, or
    // QORA_STATUS_NO_MEMORY when either cannot be had.
    int OpenCaseReader();

    // Members are destroyed in the reverse of this order, which is the order
    // in which an entry is torn down: the extension readers first, the data
    // source and the multiple response set collector last. The collector
    // and the 41 extension reader slots with their element counts join with
    // the classes they hold.
    std::unique_ptr<QORA_DataSource> fpDataSource;
    std::unique_ptr<double[]> fpBlankCase;  // write and append modes only
    std::unique_ptr<double[]> fpCaseBuffer;
    std::unique_ptr<QORA_InputCaseIterator> fpCaseReader;  // reading only; fills the case buffer
    std::vector<ValueSlot> fValueSlots;
    NameIndex fNameIndex;

    OpenMode fMode;
    CaseState fCaseState = CaseNone;
    bool fCommitted;                               // the dictionary is final
    SystemFileDataSource* fpSystemFile = nullptr;  // the data source, when it is a system file
};
