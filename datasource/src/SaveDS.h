// The writer of a system file. It works on a private copy of the dictionary,
// so that what the file needs (short names, very long strings cut into
// segments) never shows in the caller's dictionary; it writes the header and
// the dictionary records, then the cases, raw or compressed, and patches the
// case counts when it is done.
#pragma once

#include <cstdint>
#include <memory>
#include <vector>

#include "SystemFileDataSource.h"
#include "SystemFileExtensionRecord.h"
#include "writebehind.h"

class SystemFileDataSource::SaveDS : public QORA_DataSource {
  public:
    class Mover;
    class OrdinaryMover;
    class EStringMover;

    // The stream and the settings are the parent's and outlive the writer.
    SaveDS(SystemFileDataSource& parent, QORA_FileStream& stream, HeaderSettings& settings);
    // Finishes the file once cases could follow (see StartCases and
    // PrepareAppend); never raises.
    ~SaveDS() override;

    // The writer cannot be read back.
    QORA_InputCaseIterator* NewIterator(void*) override { return nullptr; }

    // Checks that no two names share a lookup key (internal error 1505) and
    // prepares the extension records, which may reshape the private
    // dictionary. Nothing is written.
    void PrepareDictionary();
    // Everything from the magic to the type 999 record, at the stream's
    // position; after PrepareDictionary.
    void WriteDictionary();
    // The cases follow at dataStart; a compressed file gets its encoder there.
    void StartCases(SparseFileIndex& index, int64_t dataStart);
    // Instead of the three above: continues the cases of an existing file,
    // whose dictionary was read into the parent. caseCountRecordPos is where
    // the case-count record's data start (0 for none).
    void PrepareAppend(SparseFileIndex& index, int64_t dataStart, int64_t caseCountRecordPos);

    // One case in the caller's layout (the parent's dictionary).
    void WriteCase(const void* units);
    // Completes the file once cases could follow: flushes the cases and
    // patches the counts. False when the file is not whole: a write failed,
    // or the counts could not be patched. Never raises; runs once (the
    // destructor runs it when nobody did).
    bool Finish() noexcept;

  private:
    void PrepareExtensions();
    void BuildMovers(const CaseLayout& source, int sourceUnits);
    void OpenCompressor(SparseFileIndex& index, int64_t dataStart);
    int64_t CompressedCases(SparseFileIndex& index, int64_t dataStart);
    void AppendRaw(int64_t dataStart);
    bool PatchCounts(int64_t total);

    HeaderSettings& fSettings;
    QORA_FileStream& fStream;
    int64_t fCasesWritten = 0;
    int64_t fCasesBefore = 0;
    int64_t fCaseCountPos = 0;
    // Subtype i at index i, from PrepareDictionary until the dictionary is written.
    std::vector<SystemFileExtensionRecord> fRecords;
    std::vector<std::unique_ptr<Mover>> fMovers;
    std::unique_ptr<unsigned char[]> fpOutput;  // the file's case, when movers exist
    std::unique_ptr<CompressedSystemFile> fpCompressor;
    WriteBehind fPending;  // raw cases on their way to the stream
    bool fCasesMayFollow = false;
    // A write failed: what reached the file is no longer known case by case.
    bool fFailed = false;
};

// Copies one share of the caller's case into its place in the file's case.
class SystemFileDataSource::SaveDS::Mover {
  public:
    virtual ~Mover() = default;
    // Returns source advanced past what was taken.
    virtual const unsigned char* Move(const unsigned char* source) const = 0;
};

// Units that stay as they are.
class SystemFileDataSource::SaveDS::OrdinaryMover : public SaveDS::Mover {
  public:
    OrdinaryMover(unsigned char* destination, int units)
        : fDestination(destination), fBytes(8 * size_t(units)) {}
    const unsigned char* Move(const unsigned char* source) const override;

  private:
    unsigned char* fDestination;
    size_t fBytes;
};

// A very long string, cut into 256-byte segments of 255 bytes of text and a
// blank each, and a shorter last segment.
class SystemFileDataSource::SaveDS::EStringMover : public SaveDS::Mover {
  public:
    EStringMover(unsigned char* destination, int width);
    const unsigned char* Move(const unsigned char* source) const override;

  private:
    unsigned char* fDestination;
    int fWidth;
    int fFullSegments;
    int fLastUnits;
};
