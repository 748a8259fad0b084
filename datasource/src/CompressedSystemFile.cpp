#include "CompressedSystemFile.h"

#include <cstring>
#include <string>

#if defined(__SSE2__)
#include <emmintrin.h>
#endif

#include "byteorder.h"
#include "dserror.h"
#include "filestream.h"
#include "sparsefileindex.h"

namespace {

constexpr uint64_t kSysmisBits = 0xFFEFFFFFFFFFFFFFull;
constexpr uint64_t kBlankBits = 0x2020202020202020ull;

// The 8 bytes each code stands for: code - 100 as a double, eight spaces for
// 254, the system-missing value for 255.
struct CodeTable {
    unsigned char unit[256][8];
    CodeTable() {
        for (int k = 0; k < 256; ++k) {
            const double value = k - CompressedSystemFile::kBias;
            std::memcpy(unit[k], &value, 8);
        }
        std::memcpy(unit[CompressedSystemFile::kBlank], &kBlankBits, 8);
        std::memcpy(unit[CompressedSystemFile::kSysmis], &kSysmisBits, 8);
    }
};
const CodeTable kCodes;

// Eight control bytes read as one word, so that a block is judged at once.
constexpr uint64_t kEachByte = 0x0101010101010101ull;
constexpr uint64_t kLow7 = 0x7F7F7F7F7F7F7F7Full;

// 0x80 in each byte of codes that equals code, 0 in every other byte.
uint64_t BytesEqual(uint64_t codes, unsigned char code) {
    const uint64_t x = codes ^ (kEachByte * code);
    return ~(((x & kLow7) + kLow7) | x) & ~kLow7;
}

uint32_t CountBytes(uint64_t marks) { return uint32_t(((marks >> 7) * kEachByte) >> 56); }

#if defined(__SSE2__)
// All ones in each 64-bit lane where a and b are equal, zeros elsewhere.
__m128i Equal64(__m128i a, __m128i b) {
    const __m128i halves = _mm_cmpeq_epi32(a, b);
    return _mm_and_si128(halves, _mm_shuffle_epi32(halves, _MM_SHUFFLE(2, 3, 0, 1)));
}

// The two 64-bit lane masks of m in the two low 32-bit lanes.
__m128i LowLanes(__m128i m) { return _mm_shuffle_epi32(m, _MM_SHUFFLE(2, 2, 2, 0)); }

__m128i Select(__m128i mask, __m128i yes, __m128i no) {
    return _mm_or_si128(_mm_and_si128(mask, yes), _mm_andnot_si128(mask, no));
}

// The codes of two units, in the two low 32-bit lanes. A unit has a number's
// code when its truncation converts back to the very same bits (so -0.0,
// fractions, NaN and magnitudes beyond 32 bits are not) and lies in the
// coded range.
[[gnu::always_inline]] inline __m128i EncodeTwo(const unsigned char* units) {
    using C = CompressedSystemFile;
    const __m128i bits = _mm_loadu_si128(reinterpret_cast<const __m128i*>(units));
    const __m128i whole = _mm_cvttpd_epi32(_mm_castsi128_pd(bits));
    const __m128i exact = LowLanes(Equal64(_mm_castpd_si128(_mm_cvtepi32_pd(whole)), bits));
    const __m128i inRange =
        _mm_and_si128(_mm_cmpgt_epi32(whole, _mm_set1_epi32(-C::kBias)),
                      _mm_cmplt_epi32(whole, _mm_set1_epi32(C::kEndOfBlock - C::kBias)));
    __m128i code = Select(_mm_and_si128(exact, inRange),
                          _mm_add_epi32(whole, _mm_set1_epi32(C::kBias)), _mm_set1_epi32(C::kRaw));
    code = Select(LowLanes(Equal64(bits, _mm_set1_epi64x(int64_t(kSysmisBits)))),
                  _mm_set1_epi32(C::kSysmis), code);
    return Select(LowLanes(Equal64(bits, _mm_set1_epi64x(int64_t(kBlankBits)))),
                  _mm_set1_epi32(C::kBlank), code);
}

// Writes the codes of eight units, judged together so that no branch
// depends on a value, and returns a mask of the raw ones (bit i for unit i).
uint32_t EncodeEight(const unsigned char* units, unsigned char* codes) {
    const __m128i low = _mm_unpacklo_epi64(EncodeTwo(units), EncodeTwo(units + 16));
    const __m128i high = _mm_unpacklo_epi64(EncodeTwo(units + 32), EncodeTwo(units + 48));
    const __m128i bytes = _mm_packus_epi16(_mm_packs_epi32(low, high), _mm_setzero_si128());
    _mm_storel_epi64(reinterpret_cast<__m128i*>(codes), bytes);
    const __m128i raw = _mm_cmpeq_epi8(bytes, _mm_set1_epi8(char(CompressedSystemFile::kRaw)));
    return uint32_t(_mm_movemask_epi8(raw)) & 0xFF;
}
#else
uint32_t EncodeEight(const unsigned char* units, unsigned char* codes) {
    uint32_t raw = 0;
    for (uint32_t i = 0; i < 8; ++i) {
        codes[i] = CompressedSystemFile::Encode(units + 8 * i);
        raw |= uint32_t(codes[i] == CompressedSystemFile::kRaw) << i;
    }
    return raw;
}
#endif

[[noreturn]] void TooShort(const char* condition, int line) {
    throw SystemFileException(kErrTooShort, condition, __FILE__, line);
}

}  // namespace

CompressedSystemFile::CompressedSystemFile(uint32_t unitsPerCase, SparseFileIndex* index,
                                           QORA_StrBaseIO* stream, int64_t dataStart)
    : fDataStart(dataStart),
      fIndex(index),
      fStream(stream),
      fFile(dynamic_cast<QORA_FileStream*>(stream)),
      fUnits(unitsPerCase),
      fAhead(new unsigned char[kReadAhead]),
      fPending(*stream) {
    QORA_ASSERT(index != nullptr);
    QORA_ASSERT(stream != nullptr);
    fStream->Seek(fDataStart, 0);
}

CompressedSystemFile::~CompressedSystemFile() {
    try {
        Finish();
    } catch (...) {
        // Nothing may escape a destructor; the writer finishes explicitly.
    }
}

unsigned char CompressedSystemFile::Encode(const unsigned char* unit) {
    uint64_t bits;
    std::memcpy(&bits, unit, 8);
    if (bits == kSysmisBits) return kSysmis;
    if (bits == kBlankBits) return kBlank;
    const uint32_t low = static_cast<uint32_t>(bits);
    const uint32_t high = static_cast<uint32_t>(bits >> 32);
    const uint32_t exponent = high & 0x7FF00000u;
    // Only 0.0 and whole numbers of magnitude 1 to 255 can have a code.
    if (low != 0 || (high != 0 && (exponent < 0x3FF00000u || exponent > 0x40600000u))) {
        return kRaw;
    }
    double value;
    std::memcpy(&value, unit, 8);
    const int k = static_cast<int>(value) + kBias;
    if (k < 1 || k >= kEndOfBlock) return kRaw;
    if (std::memcmp(kCodes.unit[k], unit, 8) != 0) return kRaw;
    return static_cast<unsigned char>(k);
}

bool CompressedSystemFile::Fill(uint32_t need) {
    unsigned char* ahead = fAhead.get();
    const uint32_t have = fAheadEnd - fAheadBegin;
    if (have >= need) return true;
    std::memmove(ahead, ahead + fAheadBegin, have);
    fAheadStart += fAheadBegin;
    fAheadBegin = 0;
    fAheadEnd = have;
    while (fAheadEnd < need) {
        const uint32_t got = fStream->Read(ahead + fAheadEnd, kReadAhead - fAheadEnd);
        if (got == 0) break;
        fAheadEnd += got;
    }
    return fAheadEnd >= need;
}

void CompressedSystemFile::DropReadAhead(int64_t position) {
    if (fStream->Seek(fDataStart + position, 0) != 0) TooShort("nRead", __LINE__);
    fAheadStart = position;
    fAheadBegin = fAheadEnd = 0;
}

// Runs once per block of eight cells: inlined, the decoder runs about a
// quarter faster than with a call per block.
[[gnu::always_inline]] inline bool CompressedSystemFile::LoadBlock() {
    if (!Fill(kKeySize)) {
        if (fAheadEnd != fAheadBegin) TooShort("nRead == 0", __LINE__);
        fAtEnd = true;
        fPos = kKeySize;
        fNextBlock = fAheadStart + fAheadBegin;
        return false;
    }
    const unsigned char* control = fAhead.get() + fAheadBegin;
    uint64_t codes;
    std::memcpy(&codes, control, kKeySize);
    const bool ends = BytesEqual(codes, kEndOfBlock) != 0;
    uint32_t raws = CountBytes(BytesEqual(codes, kRaw));
    if (ends) {
        raws = 0;
        for (uint32_t i = 0; i < kKeySize && control[i] != kEndOfBlock; ++i) {
            raws += control[i] == kRaw;
        }
    }
    // Every code fills a cell: the block can be decoded without a branch per code.
    fFullBlock = !ends && BytesEqual(codes, kSkip) == 0;
    const uint32_t length = kKeySize + kUnitSize * raws;
    if (!Fill(length)) TooShort("nRead == nu*sizeof(OBS)", __LINE__);
    fControl = fAhead.get() + fAheadBegin;
    fRawNext = fControl + kKeySize;
    fBlockStart = fAheadStart + fAheadBegin;
    fNextBlock = fBlockStart + length;
    fAheadBegin += length;
    fPos = 0;
    fAtEnd = false;
    return true;
}

void CompressedSystemFile::DecodeFullBlock(unsigned char* out) const {
    const unsigned char* raw = fControl + kKeySize;
    for (uint32_t i = 0; i < kKeySize; ++i, out += kUnitSize) {
        const unsigned char code = fControl[i];
        const bool isRaw = code == kRaw;
        std::memcpy(out, isRaw ? raw : kCodes.unit[code], kUnitSize);
        raw += isRaw ? size_t{kUnitSize} : 0;
    }
}

template <bool kStore>
uint32_t CompressedSystemFile::Decode(unsigned char* out, const unsigned char* swapMask) {
    const uint32_t n = fUnits;
    if (n == 0) return 0;
    uint32_t cell = 0;
    for (;;) {
        if (fPos >= kKeySize && !LoadBlock()) {
            if (cell == 0) return 0;
            TooShort("iCell == 0", __LINE__);
        }
        if (fFullBlock && fPos == 0 && n - cell >= kKeySize && !(kStore && swapMask)) {
            if (kStore) DecodeFullBlock(out + kUnitSize * cell);
            fRawNext = fControl + (fNextBlock - fBlockStart);
            fPos = kKeySize;
            cell += kKeySize;
            if (cell == n) return n;
            continue;
        }
        const unsigned char* control = fControl;
        const unsigned char* raw = fRawNext;
        uint32_t pos = fPos;
        while (pos < kKeySize) {
            const unsigned char code = control[pos++];
            if (code == kSkip) continue;
            if (code == kEndOfBlock) {
                pos = kKeySize;
                break;
            }
            if (code == kRaw) {
                if (kStore) {
                    std::memcpy(out + kUnitSize * cell, raw, kUnitSize);
                    if (swapMask && swapMask[cell] == 1) ReverseUnit(out + kUnitSize * cell);
                }
                raw += kUnitSize;
            } else if (kStore) {
                std::memcpy(out + kUnitSize * cell, kCodes.unit[code], kUnitSize);
            }
            if (++cell == n) {
                fPos = pos;
                fRawNext = raw;
                return n;
            }
        }
        fPos = pos;
        fRawNext = raw;
    }
}

void CompressedSystemFile::Seek(int64_t position) {
    QORA_ASSERT(position >= 0);
    const uint32_t r = static_cast<uint32_t>(position % kKeySize);
    const int64_t start = position - r;
    if (start >= fAheadStart && start <= fAheadStart + fAheadEnd) {
        fAheadBegin = static_cast<uint32_t>(start - fAheadStart);
    } else {
        DropReadAhead(start);
    }
    fAtEnd = false;
    fPos = kKeySize;
    fNextBlock = start;
    // A block boundary is loaded when it is needed, so the end of the data
    // is a position like any other.
    if (r == 0) return;
    if (!LoadBlock()) TooShort("nRead", __LINE__);
    for (uint32_t i = 0; i < r; ++i) {
        if (fControl[i] == kEndOfBlock) {
            fPos = kKeySize;
            return;
        }
        if (fControl[i] == kRaw) fRawNext += kUnitSize;
    }
    fPos = r;
}

void CompressedSystemFile::Position() {
    if (fRequested == fCurrent) return;
    if (fRequested == fCurrent - 1) {
        Seek(fLastCaseStart);
        fCurrent = fRequested;
        return;
    }
    SparseFileIndex::Entry found = fIndex->Lookup(fRequested);
    Seek(found.position);
    int64_t caseNumber = found.caseNumber;
    while (caseNumber < fRequested) {
        const int64_t start = Tell();
        if (Decode<false>(nullptr, nullptr) == 0) break;
        fIndex->Offer(caseNumber, start);
        fLastCaseStart = start;
        ++caseNumber;
    }
    fCurrent = fRequested = caseNumber;
}

uint32_t CompressedSystemFile::ReadCase(void* units, const unsigned char* swapMask) {
    Position();
    if (fAtEnd) return 0;
    const int64_t start = Tell();
    const int64_t previousStart = fLastCaseStart;
    fIndex->Offer(fCurrent, start);
    fLastCaseStart = start;
    ++fRequested;
    ++fCurrent;
    const uint32_t n = Decode<true>(static_cast<unsigned char*>(units), swapMask);
    // At the end the stream still stands before the case it could not read,
    // and the case read last is still the one before it.
    if (n == 0) {
        --fRequested;
        --fCurrent;
        fLastCaseStart = previousStart;
    }
    return n;
}

uint32_t CompressedSystemFile::EndBlock() {
    const uint32_t length = kKeySize + kUnitSize * fRawCount;
    fNextBlock = fBlockStart + length;
    fAheadStart = fNextBlock;
    fAheadBegin = fAheadEnd = 0;
    return length;
}

void CompressedSystemFile::WriteBlock() {
    fStaged += EndBlock();
    if (kStageSize - fStaged < kBlockSize) HandOver(0);
}

void CompressedSystemFile::HandOver(uint32_t extra) {
    if (fStaged + extra == 0) return;
    if (!fPending.Put(fDataStart + fStageStart, fStage, fStaged + extra))
        RaiseError(kErrStreamWrite, "compressed case data");
    std::memmove(fStage, fStage + fStaged, extra);
    fStageStart += fStaged;
    fStaged = 0;
}

// Every unit is copied to the next raw slot, which only a raw code keeps:
// the slot is free again for the next unit otherwise. A block that begins
// with eight units at hand has their codes made at once. The block's
// counters stay in locals between the blocks written.
void CompressedSystemFile::WriteCase(const void* units) {
    fIndex->Offer(fCurrent, Tell());
    const unsigned char* unit = static_cast<const unsigned char*>(units);
    const unsigned char* const end = unit + size_t{kUnitSize} * fUnits;
    uint32_t pos = fPos, raws = fRawCount;
    unsigned char* block = fStage + fStaged;
    while (unit != end) {
        if (pos >= kKeySize) {
            fBlockStart = fNextBlock;
            pos = raws = 0;
            block = fStage + fStaged;
        }
        if (pos == 0 && size_t(end - unit) >= kKeySize * kUnitSize) {
            const uint32_t raw = EncodeEight(unit, block);
            for (uint32_t i = 0; i < kKeySize; ++i, unit += kUnitSize) {
                std::memcpy(block + kKeySize + kUnitSize * raws, unit, kUnitSize);
                raws += (raw >> i) & 1;
            }
            pos = kKeySize;
        } else {
            const unsigned char code = Encode(unit);
            block[pos++] = code;
            std::memcpy(block + kKeySize + kUnitSize * raws, unit, kUnitSize);
            raws += code == kRaw;
            unit += kUnitSize;
        }
        if (pos == kKeySize) {
            fPos = pos;
            fRawCount = raws;
            WriteBlock();
        }
    }
    fPos = pos;
    fRawCount = raws;
    ++fCurrent;
    fWritten = true;
}

void CompressedSystemFile::Finish() {
    if (!fWritten) return;
    if (fPos < kKeySize) {
        std::memset(fStage + fStaged + fPos, kSkip, kKeySize - fPos);
        HandOver(EndBlock());
    } else {
        HandOver(0);
    }
    if (!fPending.Flush()) RaiseError(kErrStreamWrite, "compressed case data");
    if (fFile) fFile->Flush();
    fWritten = false;
}

void CompressedSystemFile::PrepareAppend(int64_t casesInFile) {
    fRequested = casesInFile;
    Position();
    const int64_t position = Tell();
    if (fFile) {
        fFile->Commit();
        const char* name = fFile->Name();
        if (!name || !fFile->Open(name, "r+b")) {
            throw SystemFileException(kErrCannotOpen, "m_->_file.Open(m_->_file.Name(), \"r+b\")",
                                      __FILE__, __LINE__);
        }
    }
    // A partly filled last block is carried over: the next case overwrites
    // its padding and the whole block is written again.
    if (fPos < kKeySize) {
        fRawCount = static_cast<uint32_t>(fRawNext - (fControl + kKeySize)) / kUnitSize;
        std::memcpy(fStage, fControl, kKeySize + kUnitSize * fRawCount);
    }
    fStaged = 0;
    fStageStart = position - position % kKeySize;
    DropReadAhead(position - position % kKeySize);
}
