// The compressed form of a system file's case data, in both directions.
//
// Cells are coded in blocks of 8 control bytes, each followed by the raw
// values its code 253 cells need. Reading decodes whole blocks from a
// read-ahead buffer; writing collects blocks and hands them to the stream
// in large writes.
#pragma once

#include <cstdint>
#include <memory>

#include "writebehind.h"

class QORA_StrBaseIO;
class QORA_FileStream;
class SparseFileIndex;

class CompressedSystemFile {
  public:
    enum : uint32_t { kKeySize = 8, kUnitSize = 8 };
    enum : unsigned char {
        kSkip = 0,
        kEndOfBlock = 252,
        kRaw = 253,
        kBlank = 254,
        kSysmis = 255,
        kBias = 100,
    };

    // The stream is moved to dataStart; index and stream stay the caller's.
    CompressedSystemFile(uint32_t unitsPerCase, SparseFileIndex* index, QORA_StrBaseIO* stream,
                         int64_t dataStart);
    CompressedSystemFile(const CompressedSystemFile&) = delete;
    CompressedSystemFile& operator=(const CompressedSystemFile&) = delete;
    // Finishes a written stream.
    ~CompressedSystemFile();

    // Reads the requested case into units (unitsPerCase 8-byte units); a raw
    // cell whose swapMask byte is 1 is byte-reversed. Returns the units
    // delivered, or 0 at the end of the data.
    uint32_t ReadCase(void* units, const unsigned char* swapMask);
    void SetRequestedCase(int64_t caseNumber) { fRequested = caseNumber; }
    int64_t RequestedCase() const { return fRequested; }
    int64_t CurrentCase() const { return fCurrent; }
    bool AtEnd() const { return fAtEnd; }

    void WriteCase(const void* units);
    // Writes the last, padded block. Cases written afterwards continue it.
    void Finish();

    // The compressed position: the offset from the data start of the next
    // control byte to be decoded or encoded.
    int64_t Tell() const { return fPos < kKeySize ? fBlockStart + fPos : fNextBlock; }
    void Seek(int64_t position);

    // Positions after the casesInFile cases of an existing file and reopens
    // it for writing, so that written cases continue its last block.
    void PrepareAppend(int64_t casesInFile);

    // The code the encoder gives one unit.
    static unsigned char Encode(const unsigned char* unit);

  private:
    enum : uint32_t { kReadAhead = 64 * 1024, kBlockSize = kKeySize * (1 + kUnitSize) };

    void Position();
    template <bool kStore>
    uint32_t Decode(unsigned char* out, const unsigned char* swapMask);
    bool LoadBlock();
    // The loaded block, all of whose codes fill cells, into 8 units.
    void DecodeFullBlock(unsigned char* out) const;
    bool Fill(uint32_t need);
    void DropReadAhead(int64_t position);
    // Ends the block being filled: the next one starts after it. Its length.
    uint32_t EndBlock();
    // Ends the block being filled, which then waits with the other complete
    // ones until the stage is full.
    void WriteBlock();
    // Hands the complete blocks and extra bytes after them to the collection
    // of the stream; the extra bytes stay, moved to the front.
    void HandOver(uint32_t extra);

    int64_t fCurrent = 0;
    int64_t fRequested = 0;
    const int64_t fDataStart;
    int64_t fLastCaseStart = 0;
    SparseFileIndex* const fIndex;
    QORA_StrBaseIO* const fStream;
    QORA_FileStream* const fFile;  // the stream, when it is a file stream
    const uint32_t fUnits;

    // The current block: compressed offset of its first byte, position of the
    // next control byte (kKeySize: no block), and where the next block starts.
    int64_t fBlockStart = 0;
    uint32_t fPos = kKeySize;
    int64_t fNextBlock = 0;
    bool fAtEnd = false;
    bool fWritten = false;

    // Reading: the block lies in the read-ahead buffer, which holds the
    // compressed bytes from fAheadStart up to the stream's position.
    std::unique_ptr<unsigned char[]> fAhead;
    int64_t fAheadStart = 0;
    uint32_t fAheadBegin = 0;
    uint32_t fAheadEnd = 0;
    const unsigned char* fControl = nullptr;
    const unsigned char* fRawNext = nullptr;
    bool fFullBlock = false;  // no code 0 or 252 in the loaded block

    // Writing: complete blocks, fStaged bytes of them, then the block being
    // filled: control bytes, then room for one raw value per control byte.
    // Blocks go to the collection below many at a time, not one by one.
    enum : uint32_t { kStageSize = 64 * kBlockSize };
    unsigned char fStage[kStageSize] = {};
    int64_t fStageStart = 0;  // compressed offset of the first byte
    uint32_t fStaged = 0;
    uint32_t fRawCount = 0;
    // Written blocks not yet handed to the stream; a block written again
    // (the last one, continued after a finish) starts a new collection.
    WriteBehind fPending;
};
