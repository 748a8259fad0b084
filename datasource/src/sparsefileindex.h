// A thin table of (case number, compressed position) pairs, so a compressed
// file can be positioned at any case without decoding it from the start.
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

    // The last recorded entry at or before caseNumber; (0, 0) when none.
    Entry Lookup(int64_t caseNumber);
    // Offers the compressed position of a case; kept only when it lies far
    // enough beyond the last one.
    void Offer(int64_t caseNumber, int64_t position);

    size_t Count() const { return _entries.size(); }
    int64_t Spacing() const { return _spacing; }

  private:
    enum : int64_t { kUnit = 1, kInitialSpacing = 4096, kEntryCost = 16 };

    std::vector<Entry> _entries;
    int64_t _lastPosition = -1;
    int32_t _cursor = -1;
    int64_t _spacing = kEntryCost * kUnit < 4096 ? kInitialSpacing / kUnit : kEntryCost;
};
