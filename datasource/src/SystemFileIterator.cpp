// The case iterator of a system file.
#include <algorithm>
#include <climits>
#include <cstring>

#include "CompressedSystemFile.h"
#include "SystemFileDataSource.h"
#include "byteorder.h"
#include "dserror.h"

namespace {

enum : uint32_t { kUnit = 8, kReadAhead = 256 * 1024 };

[[noreturn]] void CaseCutShort(int line) {
    throw SystemFileException(kErrTooShort, "readLen== 0 || readLen == caseLen", __FILE__, line);
}

// The units of one case in the file, as the dictionary reader counted them.
uint32_t RawUnits(const HeaderSettings& settings) {
    QORA_FILE_CHECK(kErrBadFormat, settings.fCaseSize >= 0);
    QORA_FILE_CHECK(kErrBadFormat, settings.fCaseSize <= QORA_DataSource::eMaxValueUnits);
    return uint32_t(settings.fCaseSize);
}

}  // namespace

SystemFileDataSource::Iterator::Iterator(SystemFileDataSource& source, void* buffer)
    : QORA_InputCaseIterator(source, buffer),
      fSource(source),
      fSettings(source.fSettings),
      fpDechunker(source.fSettings.fpDechunker.get()),
      fCaseBytes(kUnit * RawUnits(source.fSettings)),
      fpSwapMask(source.fSettings.fSwapped ? source.fSettings.fSwapMask.data() : nullptr),
      fStream(source.fStream) {
    const uint32_t rawUnits = fCaseBytes / kUnit;
    const uint32_t caseUnits = uint32_t(source.ValueCount());
    if (fpDechunker != nullptr && fpDechunker->IsEmpty()) fpDechunker = nullptr;
    if (fpDechunker != nullptr) {
        fpDechunker->Validate(rawUnits, caseUnits);
        fpRaw.reset(new unsigned char[std::max<uint32_t>(fCaseBytes, kUnit)]);
    } else {
        QORA_FILE_CHECK(kErrBadFormat, rawUnits == caseUnits);
    }
    if (fpSwapMask != nullptr)
        QORA_FILE_CHECK(kErrBadFormat, fSettings.fSwapMask.size() == rawUnits);
    if (fSettings.fCompressed) {
        fpCompressed.reset(
            new CompressedSystemFile(rawUnits, &source.fIndex, &fStream, source.fDataStart));
    } else {
        fAheadSize = std::max<uint32_t>(kReadAhead, fCaseBytes);
        fpAhead.reset(new unsigned char[fAheadSize]);
    }
    ++source.fLiveIterators;
}

SystemFileDataSource::Iterator::~Iterator() {
    fpCompressed.reset();
    --fSource.fLiveIterators;
}

// Positions beyond what a 64-bit file offset can name are refused, like
// positions before the first case.
bool SystemFileDataSource::Iterator::SeekCase(int64_t caseNumber) {
    if (caseNumber < 0) return false;
    if (fCaseBytes > 0 && caseNumber > (INT64_MAX - fSource.fDataStart) / fCaseBytes) return false;
    fRequested = caseNumber;
    return true;
}

void SystemFileDataSource::Iterator::Reposition() {
    if (fpCompressed) {
        fpCompressed->SetRequestedCase(fRequested);
    } else {
        int64_t at = fSource.fDataStart + fRequested * fCaseBytes;
        // Nothing lies beyond the end, and the system may refuse to go there.
        if (at > fFileEnd) at = std::min(at, fFileEnd = FileEnd());
        fStream.Seek(at, 0);
        fAheadBegin = fAheadEnd = 0;
    }
    fFileCase = fRequested;
}

int64_t SystemFileDataSource::Iterator::FileEnd() {
    fStream.Seek(0, 2);
    return fStream.Tell();
}

uint32_t SystemFileDataSource::Iterator::ReadAhead(unsigned char* destination) {
    unsigned char* ahead = fpAhead.get();
    if (fAheadEnd - fAheadBegin < fCaseBytes) {
        std::memmove(ahead, ahead + fAheadBegin, fAheadEnd - fAheadBegin);
        fAheadEnd -= fAheadBegin;
        fAheadBegin = 0;
        while (fAheadEnd < fCaseBytes) {
            // Ending on a block boundary lets the stream read it all in one call.
            uint32_t want = fAheadSize - fAheadEnd;
            const int64_t aligned =
                (fStream.Tell() + want) & ~int64_t{QORA_FileStream::kBlockAlign - 1};
            if (aligned - fStream.Tell() >= int64_t{fCaseBytes - fAheadEnd})
                want = uint32_t(aligned - fStream.Tell());
            const uint32_t got = fStream.Read(ahead + fAheadEnd, want);
            if (got == 0) break;
            fAheadEnd += got;
        }
        if (fAheadEnd == 0) return 0;
        if (fAheadEnd < fCaseBytes) CaseCutShort(__LINE__);
    }
    std::memcpy(destination, ahead + fAheadBegin, fCaseBytes);
    fAheadBegin += fCaseBytes;
    return fCaseBytes;
}

uint32_t SystemFileDataSource::Iterator::ReadRaw(unsigned char* destination) {
    if (fpCompressed) return kUnit * fpCompressed->ReadCase(destination, fpSwapMask);
    const uint32_t got = fCaseBytes == 0 ? 0 : ReadAhead(destination);
    if (got != 0 && fpSwapMask != nullptr) {
        for (uint32_t u = 0; u < fCaseBytes / kUnit; ++u)
            if (fpSwapMask[u] == 1) ReverseUnit(destination + size_t{kUnit} * u);
    }
    return got;
}

// The end of the data tells how many cases the file holds, whatever its
// header said: compressed positioning stops at the end, and the size of raw
// data counts its cases.
void SystemFileDataSource::Iterator::NoteEnd() {
    int64_t cases = 0;
    if (fpCompressed) {
        cases = fpCompressed->CurrentCase();
    } else {
        fFileEnd = FileEnd();
        const int64_t dataBytes = fFileEnd - fSource.fDataStart;
        cases = dataBytes > 0 && fCaseBytes > 0 ? dataBytes / fCaseBytes : 0;
        cases = std::min(cases, fFileCase);
        fFileCase = -1;  // the stream was moved
        fAheadBegin = fAheadEnd = 0;
    }
    fSettings.fCaseCount = cases;
}

bool SystemFileDataSource::Iterator::ReadCase() {
    if (fRequested != fFileCase) Reposition();
    unsigned char* const target = static_cast<unsigned char*>(Case().Buffer());
    uint32_t got;
    try {
        got = ReadRaw(fpRaw ? fpRaw.get() : target);
    } catch (...) {
        fFileCase = -1;  // the next read starts that case again
        throw;
    }
    if (got == 0) {
        NoteEnd();
        return false;
    }
    if (fpRaw) fpDechunker->Rebuild(fpRaw.get(), target);
    ++fRequested;
    ++fFileCase;
    return got == fCaseBytes;
}
