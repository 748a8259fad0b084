// Slot numbers: the 1-based value unit numbers by which a system file names
// variables (value label records, the header's weight). Every unit of a case
// has a slot; only the first unit of each variable names that variable.
#pragma once

#include <cstdint>
#include <vector>

#include "datasrc.h"

class SlotDictionary {
  public:
    // Built over the dictionary as it stands; owns nothing of the source.
    explicit SlotDictionary(QORA_DataSource& source);
    // After the dictionary changed other than through NewVariable.
    void Rebuild();

    int Count() const { return static_cast<int>(fEntries.size()); }
    // Whether slot names a variable: in range and not the continuation of a
    // long string.
    bool IsValidSlot(int slot) const { return IndexOfSlot(slot) >= 0; }
    // The dictionary index of the variable the slot names, or -1.
    int IndexOfSlot(int slot) const;
    // Strict: the slot must be valid (for slots the library made itself).
    QORA_Variable& VariableAt(int slot);
    // Lenient: an invalid handle for an invalid slot (for slots from a file).
    QORA_Variable VariableAtOrNull(int slot) const;

    // Appends a new variable of the type to the source; its index goes to *index.
    QORA_Variable& NewVariable(int type, int* index);

  private:
    void AddEntries(int index, int type);

    QORA_DataSource* fpSource;
    // Per unit: the variable's index on its first unit, -1 on the others.
    std::vector<int32_t> fEntries;
};
