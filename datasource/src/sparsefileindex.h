// Where cases start in compressed case data: a small table of (case number,
// position) pairs, positions counted from the start of the data. It grows as
// cases are read or written and thins itself, so its size grows with the
// square root of the data size. Shared by the iterators and the writer of one
// data source.
#pragma once

#include <cstddef>
#include <cstdint>
#include <vector>

class SparseFileIndex {
  public:
    struct Entry {
        int64_t caseNumber;
        int64_t position;
    };

    enum : uint32_t {
        kInitialSpacing = 4096,
        // The table holds fewer than spacing / kBytesPerEntry entries: reaching
        // that many halves it and doubles the spacing.
        kBytesPerEntry = 16,
    };

    // unit multiplies the spacing; precondition unit >= 1.
    explicit SparseFileIndex(uint32_t unit = 1);

    // The last recorded case start at or before caseNumber; (0, 0), the start
    // of the data, when none is recorded.
    Entry Lookup(int64_t caseNumber);
    // A case start met while reading or writing; recorded when it lies far
    // enough beyond the latest one.
    void Offer(int64_t caseNumber, int64_t position);

    size_t Count() const { return fEntries.size(); }
    const Entry& At(size_t k) const { return fEntries[k]; }
    uint32_t Spacing() const { return fSpacing; }
    int64_t LastPosition() const { return fLastPosition; }

  private:
    void Thin();

    std::vector<Entry> fEntries;
    int64_t fLastPosition = -1;
    int32_t fCursor = -1;
    uint32_t fSpacing;
    uint32_t fUnit;
};
