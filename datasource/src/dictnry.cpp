#include "dictnry.h"

SlotDictionary::SlotDictionary(QORA_DataSource& source) : fpSource(&source) { Rebuild(); }

void SlotDictionary::Rebuild() {
    fEntries.clear();
    fEntries.reserve(fpSource->ValueCount());
    for (int i = 0; i < fpSource->ColumnCount(); ++i)
        AddEntries(i, fpSource->GetVariable(i).GetType());
}

void SlotDictionary::AddEntries(int index, int type) {
    fEntries.push_back(index);
    fEntries.insert(fEntries.end(), ValueUnits(type) - 1, -1);
}

int SlotDictionary::IndexOfSlot(int slot) const {
    if (slot < 1 || slot > Count()) return -1;
    return fEntries[slot - 1];
}

QORA_Variable& SlotDictionary::VariableAt(int slot) {
    const int index = IndexOfSlot(slot);
    QORA_ASSERT(0 <= index);
    return fpSource->GetVariable(index);
}

QORA_Variable SlotDictionary::VariableAtOrNull(int slot) const {
    const int index = IndexOfSlot(slot);
    return index < 0 ? QORA_Variable() : fpSource->GetVariable(index);
}

QORA_Variable& SlotDictionary::NewVariable(int type, int* index) {
    // Room first, so that a failure leaves the slots in step with the source.
    ReserveMore(fEntries, ValueUnits(type));
    QORA_Variable& var = fpSource->NewVariable(type, index);
    AddEntries(*index, type);
    return var;
}
