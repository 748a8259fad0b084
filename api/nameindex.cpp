#include "nameindex.h"

#include <algorithm>
#include <cstring>

namespace {

// Blocks double from the first up to the largest, so that a small
// dictionary takes little and a large one few blocks.
enum : size_t { kFirstBlockBytes = 256, kLargestBlockBytes = 64 * 1024 };

}  // namespace

void NameIndex::Reset(size_t count) {
    fBlocks.clear();
    fNext = nullptr;
    fRoom = 0;
    fBlockBytes = 0;
    fTable = NameTable(count);
}

bool NameIndex::Insert(std::string_view key, int32_t index) {
    return fTable.Insert(Keep(key), index);
}

std::string_view NameIndex::Keep(std::string_view key) {
    if (key.size() > fRoom) {
        fBlockBytes = std::clamp<size_t>(2 * fBlockBytes, kFirstBlockBytes, kLargestBlockBytes);
        fRoom = std::max(fBlockBytes, key.size());
        fBlocks.emplace_back(new char[fRoom]);
        fNext = fBlocks.back().get();
    }
    const std::string_view copy(fNext, key.size());
    if (!key.empty()) std::memcpy(fNext, key.data(), key.size());
    fNext += key.size();
    fRoom -= key.size();
    return copy;
}
