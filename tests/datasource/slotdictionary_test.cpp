#include <gtest/gtest.h>

#include "dictnry.h"

namespace {

class TestSource : public QORA_DataSource {
  public:
    QORA_InputCaseIterator* NewIterator(void*) override { return nullptr; }
};

TEST(SlotDictionaryTest, ContinuationUnitsNameNoVariable) {
    TestSource ds;
    int index = -1;
    ds.NewVariable(12, &index);
    ds.NewVariable(0, &index);
    SlotDictionary slots(ds);
    EXPECT_EQ(slots.Count(), 3);
    EXPECT_EQ(slots.IndexOfSlot(2), -1);
    EXPECT_EQ(slots.VariableAt(3).GetID(), ds.GetVariable(1).GetID());
    for (int slot : {-1, 0, 2, 4, 0x7FFFFFFF}) {
        EXPECT_FALSE(slots.IsValidSlot(slot)) << slot;
        EXPECT_FALSE(slots.VariableAtOrNull(slot).IsValid()) << slot;
        EXPECT_THROW(slots.VariableAt(slot), ErrorText) << slot;
    }
    EXPECT_EQ(slots.VariableAtOrNull(1).GetID(), ds.GetVariable(0).GetID());
}

TEST(SlotDictionaryTest, NewVariablesAndRebuild) {
    TestSource ds;
    SlotDictionary slots(ds);
    int index = -1;
    slots.NewVariable(20, &index);
    slots.NewVariable(9, &index);
    slots.NewVariable(8, &index);
    EXPECT_EQ(index, 2);
    EXPECT_EQ(slots.Count(), 6);
    EXPECT_EQ(slots.IndexOfSlot(4), 1);
    EXPECT_EQ(slots.IndexOfSlot(6), 2);
    EXPECT_THROW(slots.NewVariable(32768, &index), ErrorText);
    EXPECT_EQ(slots.Count(), 6);

    ds.DeleteVariables(0, 0);
    slots.Rebuild();
    EXPECT_EQ(slots.Count(), 3);
    EXPECT_EQ(slots.IndexOfSlot(1), 0);
    EXPECT_EQ(slots.IndexOfSlot(3), 1);
}

}  // namespace
