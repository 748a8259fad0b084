#include "nametable.h"

#include <algorithm>
#include <functional>

namespace {

uint64_t HashOf(std::string_view name) { return std::hash<std::string_view>()(name); }

// The part of a hash that a slot keeps beside its entry, so that most
// probes of other names never read those names.
uint64_t Tag(uint64_t hash) { return hash >> 32 << 32; }

}  // namespace

NameTable::NameTable(size_t capacity) { Resize(capacity); }

void NameTable::Resize(size_t capacity) {
    fCapacity = capacity;
    size_t slots = 2;
    while (slots < 2 * capacity) slots *= 2;
    fSlots.assign(slots, 0);
    fEntries.reserve(capacity);
    for (size_t i = 0; i < fEntries.size(); ++i) {
        const uint64_t hash = HashOf(fEntries[i].first);
        fSlots[SlotOf(fEntries[i].first, hash)] = Tag(hash) | (i + 1);
    }
}

size_t NameTable::SlotOf(std::string_view name, uint64_t hash) const {
    const size_t mask = fSlots.size() - 1;
    for (size_t at = size_t(hash) & mask;; at = (at + 1) & mask) {
        const uint64_t slot = fSlots[at];
        if (slot == 0) return at;
        if (Tag(slot) == Tag(hash) && fEntries[uint32_t(slot) - 1].first == name) return at;
    }
}

bool NameTable::Insert(std::string_view name, int32_t value) {
    if (fEntries.size() == fCapacity) Resize(std::max<size_t>(4, 2 * fCapacity));
    const uint64_t hash = HashOf(name);
    uint64_t& slot = fSlots[SlotOf(name, hash)];
    if (slot != 0) return false;
    fEntries.emplace_back(name, value);
    slot = Tag(hash) | fEntries.size();
    return true;
}

int32_t NameTable::Find(std::string_view name) const {
    const uint64_t slot = fSlots[SlotOf(name, HashOf(name))];
    return slot == 0 ? -1 : fEntries[uint32_t(slot) - 1].second;
}
