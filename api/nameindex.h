// A handle's variable names by lookup key. The keys are copies, kept in
// blocks that never move, so that the table can point into them whatever
// later happens to the variables: a large dictionary costs a few blocks
// instead of a node and a key string for each variable.
#pragma once

#include <cstddef>
#include <cstdint>
#include <memory>
#include <string_view>
#include <vector>

#include "nametable.h"

class NameIndex {
  public:
    // Empties the index, with room for count keys.
    void Reset(size_t count);
    // Adds key with the dictionary index unless the index has the key:
    // false then (the copy made of it stays unused).
    bool Insert(std::string_view key, int32_t index);
    // The dictionary index of key, or -1.
    int32_t Find(std::string_view key) const { return fTable.Find(key); }

  private:
    // A copy of key in the current block, which a new block replaces when
    // the key does not fit.
    std::string_view Keep(std::string_view key);

    std::vector<std::unique_ptr<char[]>> fBlocks;
    char* fNext = nullptr;  // the free bytes of the current block
    size_t fRoom = 0;
    size_t fBlockBytes = 0;  // the size of the last block made
    NameTable fTable{0};
};
