#include "sparsefileindex.h"

SparseFileIndex::Entry SparseFileIndex::Lookup(int64_t caseNumber) {
    if (_entries.empty() || caseNumber < _entries.front().caseNumber) return {0, 0};
    const int32_t count = static_cast<int32_t>(_entries.size());
    if (_cursor >= 0 && _cursor < count && _entries[_cursor].caseNumber <= caseNumber &&
        (_cursor + 1 == count || _entries[_cursor + 1].caseNumber > caseNumber)) {
        return _entries[_cursor];
    }
    int32_t left = -1;
    int32_t right = count;
    while (left + 1 < right) {
        const int32_t middle = (left + right) / 2;
        if (_entries[middle].caseNumber <= caseNumber) {
            left = middle;
        } else {
            right = middle;
        }
    }
    _cursor = left;
    return _entries[left];
}

void SparseFileIndex::Offer(int64_t caseNumber, int64_t position) {
    if (position <= _lastPosition) return;
    // One case longer than the spacing widens it, or every case would count.
    if (position - _lastPosition > _spacing * kUnit) _spacing = (position - _lastPosition) / kUnit;
    if (!_entries.empty() && _entries.back().position + _spacing > position) {
        _lastPosition = position;
        return;
    }
    _entries.push_back({caseNumber, position});
    if (kUnit * _spacing <= kEntryCost * static_cast<int64_t>(_entries.size())) {
        const size_t keep = _entries.size() / 2;
        for (size_t i = 0; i < keep; ++i) _entries[i] = _entries[2 * i];
        _entries.resize(keep);
        _spacing *= 2;
        _cursor = -1;
    }
    _lastPosition = position;
}
