// The data source behind every system file: its reading side (the opening
// factory, the dictionary reader and what the file said) and the empty
// source that a file opened for writing starts from.
#pragma once

#include <cstdint>
#include <memory>
#include <string>

#include "HeaderSettings.h"
#include "case.h"
#include "datasrc.h"
#include "filestream.h"
#include "sparsefileindex.h"

class CompressedSystemFile;

// A data source that keeps its cases in a file of its own.
class IndependentDataStore : public QORA_DataSource {
  public:
    using QORA_DataSource::QORA_DataSource;
    // One case in the dictionary's layout (ValueCount() units).
    virtual void WriteCase(const void* units) = 0;
    // Completes the file on disk; nothing when no cases are being written.
    // Raises internal error 1002 when the file could not be completed (a
    // write failed, or its counts could not be patched).
    virtual void FinishWriting() = 0;
    // Takes effect when the dictionary is written.
    virtual void SetCompression(bool on) = 0;
    // Writes the dictionary; cases may follow.
    virtual void CommitDictionary() = 0;
};

// Receives the warnings of the opening factory.
class WarningSink {
  public:
    virtual ~WarningSink() = default;
    virtual void Warning(long number, const std::string& text) = 0;
};

class SystemFileDataSource : public IndependentDataStore {
  public:
    enum State { kNothingYet = 0, kWriting = 1, kReading = 2 };
    class Iterator;
    class SaveDS;

    // An empty source for a file that is to be written.
    SystemFileDataSource();
    // Opens the file (name in the interface encoding) and reads its whole
    // dictionary. A file that cannot be opened raises internal error 1201, a
    // malformed one 1204 or 1205; the error carries the file name and nests
    // the SystemFileException with the failed condition.
    explicit SystemFileDataSource(const char* fileName);
    // The same for a name kept in a name record.
    explicit SystemFileDataSource(const QORA_FileStream::Data::FileName& name);
    // Finishes a file whose cases are being written.
    ~SystemFileDataSource() override;

    // A reader of the cases with a stream of its own.
    QORA_InputCaseIterator* NewIterator(void* buffer) override;
    int64_t CaseCount() const override { return fSettings.fCaseCount; }
    void SetCompression(bool on) override { fSettings.fCompressed = on; }

    // Writing. The file named by GetFileName() is created when the
    // dictionary is committed (internal error 1209 when anything was read or
    // written before). Writing cases to a source that was read appends them
    // to its file; writing them while a case iterator exists is refused
    // (1209). A SystemFileException comes out as an internal error with the
    // same number and the file name, nesting the original.
    void CommitDictionary() override;
    void WriteCase(const void* units) override;
    void FinishWriting() override;

    // What the file said.
    // Whether a type 7 record of the subtype was read (subtype 0: documents).
    virtual bool HasExtensionRecord(int subtype) const { return fSettings.HasSeen(subtype); }
    // The release numbers; true only when the integer information record was read.
    virtual bool GetReleaseInfo(int* major, int* minor, int* revision) const;
    virtual bool IsSwapped() const { return fSettings.fSwapped; }
    virtual double FileSystemMissing() const { return fSettings.fSysmis; }
    // The current stream position is where the case-count record's data start.
    virtual void NoteCaseCountRecord() { fCaseCountRecordPos = fStream.Tell(); }

    const HeaderSettings& Settings() const { return fSettings; }
    HeaderSettings& Settings() { return fSettings; }
    State GetState() const { return fState; }
    int64_t DataStart() const { return fDataStart; }
    // 0 when the file has no case-count record.
    int64_t CaseCountRecordPosition() const { return fCaseCountRecordPos; }
    // Where cases start in compressed data, shared by all iterators.
    SparseFileIndex& Index() { return fIndex; }
    // The case iterators that exist over this source.
    int32_t LiveIterators() const { return fLiveIterators; }

  private:
    // Header, dictionary records and the repairs, up to the case data.
    void Read();
    void StartAppending();

    State fState = kNothingYet;
    // An append that could not start may have left the stream anywhere:
    // no case is written after it, so none lands on the cases already there.
    bool fAppendFailed = false;
    HeaderSettings fSettings;
    QORA_FileStream fStream;
    int64_t fDataStart = 0;
    int64_t fCaseCountRecordPos = 0;
    SparseFileIndex fIndex;
    int32_t fLiveIterators = 0;
    std::unique_ptr<SaveDS> fpWriter;  // while cases are written
};

// Reads the cases of a system file: positions by arithmetic when the data
// are raw and through the sparse index when compressed, corrects the case
// count at the end of the data, and joins very long strings again.
class SystemFileDataSource::Iterator : public QORA_InputCaseIterator {
  public:
    // The source must outlive the iterator. buffer: optional caller units.
    Iterator(SystemFileDataSource& source, void* buffer);
    ~Iterator() override;

    bool CanSeek() const override { return true; }
    bool SeekCase(int64_t caseNumber) override;
    int64_t TellCase() const override { return fRequested; }
    bool ReadCase() override;

  private:
    // Reads the file's case: bytes delivered, 0 at the end of the data.
    uint32_t ReadRaw(unsigned char* destination);
    uint32_t ReadAhead(unsigned char* destination);
    void Reposition();
    int64_t FileEnd();
    void NoteEnd();

    SystemFileDataSource& fSource;
    HeaderSettings& fSettings;
    const SystemFileDechunker* fpDechunker;  // null: cases are read as they are
    int64_t fRequested = 0;
    int64_t fFileCase = -1;           // the case the stream stands before; -1 unknown
    const uint32_t fCaseBytes;        // a case in the file
    const unsigned char* fpSwapMask;  // null for a file in the machine's order
    QORA_FileStream fStream;
    std::unique_ptr<CompressedSystemFile> fpCompressed;
    std::unique_ptr<unsigned char[]> fpRaw;  // the file's case, when strings are joined

    // Raw data are read well ahead of the case, so that a case costs no call
    // to the system: the bytes from fAheadBegin to fAheadEnd come next.
    std::unique_ptr<unsigned char[]> fpAhead;
    uint32_t fAheadSize = 0;
    uint32_t fAheadBegin = 0;
    uint32_t fAheadEnd = 0;
    int64_t fFileEnd = 0;  // the size of the file when last looked at
};

// Opens a system file for reading. The name is in the interface encoding;
// warnings go to the sink when one is given. A file whose text is in another
// encoding than the interface's comes converted, through a transcoding data
// source that owns the file's own source, when one of the two is UTF-8.
std::unique_ptr<QORA_DataSource> OpenForReading(const char* fileName, WarningSink* warnings);
