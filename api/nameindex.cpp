#include "nameindex.h"

#include <algorithm>
#include <cstring>

namespace {

enum : size_t { kBlockBytes = 64 * 1024 };

}  // namespace

void NameIndex::Reset(size_t count) {
    fBlocks.clear();
    fNext = nullptr;
    fRoom = 0;
    fTable = NameTable(count);
}

bool NameIndex::Insert(std::string_view key, int32_t index) {
    return fTable.Insert(Keep(key), index);
}

std::string_view NameIndex::Keep(std::string_view key) {
    if (key.size() > fRoom) {
        fRoom = std::max<size_t>(kBlockBytes, key.size());
        fBlocks.emplace_back(new char[fRoom]);
        fNext = fBlocks.back().get();
    }
    const std::string_view copy(fNext, key.size());
    if (!key.empty()) std::memcpy(fNext, key.data(), key.size());
    fNext += key.size();
    fRoom -= key.size();
    return copy;
}
