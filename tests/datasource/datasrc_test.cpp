// The case layout and the split of a data source after variables are deleted:
// the very long string records delete segments anywhere in a dictionary.
#include "datasrc.h"

#include <gtest/gtest.h>

#include <tuple>

namespace {

class Source : public QORA_DataSource {
    QORA_InputCaseIterator* NewIterator(void*) override { return nullptr; }
};

// The layout must equal the one recomputed from the variables' widths.
void ExpectExactLayout(const QORA_DataSource& ds) {
    const CaseLayout& layout = ds.Layout();
    int32_t offset = 0;
    for (int i = 0; i < ds.ColumnCount(); ++i) {
        EXPECT_EQ(layout.Offset(i), offset) << "variable " << i;
        offset += ds.GetVariable(i).ValueUnits();
    }
    EXPECT_EQ(layout.Total(), offset);
    const int n = ds.ColumnCount();
    EXPECT_EQ(layout.LastSize(), n ? ds.GetVariable(n - 1).ValueUnits() : 0);
}

}  // namespace

TEST(DataSourceTest, DeletesKeepTheLayoutExact) {
    Source ds;
    int index = -1;
    for (int type : {0, 12, 0, 30, 9, 0}) ds.NewVariable(type, &index);
    const int split[] = {4, 5};
    ds.SetSplitVars(2, split, true);
    // The front, the last two (the split goes), all but the first, the only one left.
    const std::tuple<int, int, uint32_t> deletes[] = {{0, 0, 2}, {3, 4, 0}, {1, 2, 0}, {0, 0, 0}};
    for (auto [first, last, splitCount] : deletes) {
        SCOPED_TRACE(first);
        ds.DeleteVariables(first, last);
        ExpectExactLayout(ds);
        EXPECT_EQ(ds.SplitVarCount(), splitCount);
        EXPECT_EQ(ds.IsSplitSorted(), splitCount > 0);
    }
    EXPECT_EQ(ds.ColumnCount(), 0);
}
