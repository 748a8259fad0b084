#include "sparsefileindex.h"

#include <algorithm>

#include "dserror.h"

namespace {

uint32_t InitialSpacing(uint32_t unit) {
    QORA_ASSERT(unit >= 1);
    return SparseFileIndex::kBytesPerEntry * uint64_t{unit} < SparseFileIndex::kInitialSpacing
               ? SparseFileIndex::kInitialSpacing / unit
               : SparseFileIndex::kBytesPerEntry;
}

}  // namespace

SparseFileIndex::SparseFileIndex(uint32_t unit) : fSpacing(InitialSpacing(unit)), fUnit(unit) {}

SparseFileIndex::Entry SparseFileIndex::Lookup(int64_t caseNumber) {
    if (fEntries.empty() || caseNumber < fEntries.front().caseNumber) return {0, 0};
    const size_t count = fEntries.size();
    if (fCursor >= 0 && static_cast<size_t>(fCursor) < count) {
        const size_t k = static_cast<size_t>(fCursor);
        if (fEntries[k].caseNumber <= caseNumber &&
            (k + 1 == count || fEntries[k + 1].caseNumber > caseNumber))
            return fEntries[k];
    }
    int64_t left = -1;
    int64_t right = static_cast<int64_t>(count);
    while (left + 1 < right) {
        const int64_t middle = (left + right) / 2;
        if (fEntries[static_cast<size_t>(middle)].caseNumber <= caseNumber)
            left = middle;
        else
            right = middle;
    }
    fCursor = static_cast<int32_t>(left);
    return fEntries[static_cast<size_t>(left)];
}

void SparseFileIndex::Offer(int64_t caseNumber, int64_t position) {
    if (position <= fLastPosition) return;
    // A case longer than the spacing widens it, so that each entry still
    // covers at least one case. Kept within 32 bits whatever the caller offers.
    const uint64_t distance = static_cast<uint64_t>(position - fLastPosition);
    if (distance > uint64_t{fSpacing} * fUnit)
        fSpacing = static_cast<uint32_t>(std::min<uint64_t>(distance / fUnit, UINT32_MAX / 2));
    if (!fEntries.empty() && fEntries.back().position + fSpacing > position) {
        fLastPosition = position;
        return;
    }
    fEntries.push_back({caseNumber, position});
    if (uint64_t{fUnit} * fSpacing <= uint64_t{kBytesPerEntry} * fEntries.size()) Thin();
    fLastPosition = position;
}

void SparseFileIndex::Thin() {
    const size_t kept = fEntries.size() / 2;
    for (size_t i = 0; i < kept; ++i) fEntries[i] = fEntries[2 * i];
    fEntries.resize(kept);
    fSpacing = fSpacing <= UINT32_MAX / 2 ? fSpacing * 2 : UINT32_MAX;
}
