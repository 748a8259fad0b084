// Names, each with a number, found in a time that does not grow with how
// many there are: open addressing over a power-of-two table kept at most
// half full, one allocation for all. A node per name cost an allocation and
// a miss of the cache or two for every name of a large dictionary. The names
// stay the caller's, alive and unchanged while the table is in use.
#pragma once

#include <cstddef>
#include <cstdint>
#include <string_view>
#include <utility>
#include <vector>

class NameTable {
  public:
    // Room for capacity names; more make the table grow.
    explicit NameTable(size_t capacity);

    // Adds name with value unless the table has it already: false then.
    bool Insert(std::string_view name, int32_t value);
    // The value name came with, or -1 when it is not there.
    int32_t Find(std::string_view name) const;

  private:
    // The slot that holds name, or the empty one where it would go.
    size_t SlotOf(std::string_view name, uint64_t hash) const;
    // Makes room for capacity names and places the entries anew.
    void Resize(size_t capacity);

    // The high half of a name's hash, and its entry + 1 (0: empty).
    std::vector<uint64_t> fSlots;
    std::vector<std::pair<std::string_view, int32_t>> fEntries;
    size_t fCapacity;
};
