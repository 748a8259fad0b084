#include "SystemFileDechunker.h"

#include <cstring>

#include "dserror.h"

namespace {

enum : uint32_t { kUnit = 8 };

// Bytes 252 to 254 of a full segment belong to the string up to the last
// one that is not NUL: a writer fills with NULs rather than cut a character.
uint32_t SegmentShare(const unsigned char* segment) {
    using Plan = SystemFileDechunker;
    for (uint32_t n = Plan::kSegmentWidth; n > Plan::kSureBytes; --n) {
        if (segment[n - 1] != 0) return n;
    }
    return Plan::kSureBytes;
}

}  // namespace

uint32_t SystemFileDechunker::FileUnits(uint32_t width) {
    return ((width / kSureBytes) * kSegmentBytes + width % kSureBytes + kUnit - 1) / kUnit;
}

uint32_t SystemFileDechunker::CaseUnits(uint32_t width) {
    return width <= kUnit ? 1 : (width + kUnit - 1) / kUnit;
}

SystemFileDechunker::Entry SystemFileDechunker::StringEntry(uint32_t sourceUnit, uint32_t width,
                                                            uint32_t targetUnit,
                                                            uint32_t ordinaryUnits) {
    return {sourceUnit,
            width,
            targetUnit,
            sourceUnit + FileUnits(width),
            targetUnit + CaseUnits(width),
            ordinaryUnits};
}

SystemFileDechunker::Entry SystemFileDechunker::LeadingEntry(uint32_t ordinaryUnits) {
    return {0, 0, 0, 0, 0, ordinaryUnits};
}

// With the units after a string agreeing with its width, the copy stays
// inside the string's segments: every full segment gives at least 252 bytes,
// so no more segments are read than the file has, and the last one is read
// no further than the bytes that remain.
void SystemFileDechunker::Validate(uint32_t rawUnits, uint32_t caseUnits) const {
    for (const Entry& e : fEntries) {
        const uint64_t fileUnits = e.width == 0 ? 0 : FileUnits(e.width);
        const uint64_t ownUnits = e.width == 0 ? 0 : CaseUnits(e.width);
        QORA_FILE_CHECK(kErrBadFormat, e.sourceUnitAfter == uint64_t{e.sourceUnit} + fileUnits);
        QORA_FILE_CHECK(kErrBadFormat, e.targetUnitAfter == uint64_t{e.targetUnit} + ownUnits);
        QORA_FILE_CHECK(kErrBadFormat, uint64_t{e.sourceUnitAfter} + e.ordinaryUnits <= rawUnits);
        QORA_FILE_CHECK(kErrBadFormat, uint64_t{e.targetUnitAfter} + e.ordinaryUnits <= caseUnits);
    }
}

void SystemFileDechunker::Rebuild(const unsigned char* raw, unsigned char* target) const {
    for (const Entry& e : fEntries) {
        const unsigned char* source = raw + size_t{kUnit} * e.sourceUnit;
        unsigned char* out = target + size_t{kUnit} * e.targetUnit;
        uint32_t remaining = e.width;
        while (remaining > kSegmentWidth) {
            const uint32_t n = SegmentShare(source);
            std::memcpy(out, source, n);
            out += n;
            remaining -= n;
            source += kSegmentBytes;
        }
        std::memcpy(out, source, remaining);
        out += remaining;
        unsigned char* const after = target + size_t{kUnit} * e.targetUnitAfter;
        std::memset(out, ' ', size_t(after - out));
        std::memcpy(after, raw + size_t{kUnit} * e.sourceUnitAfter,
                    size_t{kUnit} * e.ordinaryUnits);
    }
}
