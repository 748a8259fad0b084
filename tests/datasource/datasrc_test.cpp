#include "datasrc.h"

#include <gtest/gtest.h>

#include <cstring>
#include <string>
#include <vector>

#include "qoramb.h"

namespace {

class TestSource : public QORA_DataSource {
  public:
    using QORA_DataSource::QORA_DataSource;
    QORA_InputCaseIterator* NewIterator(void*) override { return nullptr; }
};

// Appends variables of the given types, named v0, v1, ...
void AddVariables(QORA_DataSource& ds, const std::vector<int>& types) {
    for (int type : types) {
        int index = -1;
        ds.NewVariable(type, &index).SetName(("v" + std::to_string(index)).c_str());
    }
}

// The layout must equal the one recomputed from the variables' widths.
void ExpectExactLayout(const QORA_DataSource& ds) {
    const CaseLayout& layout = ds.Layout();
    ASSERT_EQ(layout.Count(), size_t(ds.ColumnCount()));
    int32_t offset = 0;
    for (int i = 0; i < ds.ColumnCount(); ++i) {
        EXPECT_EQ(layout.Offset(i), offset) << "variable " << i;
        offset += ds.GetVariable(i).ValueUnits();
    }
    EXPECT_EQ(layout.Total(), offset);
    EXPECT_EQ(ds.ValueCount(), offset);
    EXPECT_EQ(ds.ValueOffset(ds.ColumnCount()), offset);
    const int n = ds.ColumnCount();
    EXPECT_EQ(layout.LastSize(), n ? ds.GetVariable(n - 1).ValueUnits() : 0);
}

TEST(DataSourceTest, AppendAndInsertLayOutUnits) {
    TestSource ds;
    AddVariables(ds, {0, 12, 8, 9, 0});
    ExpectExactLayout(ds);
    EXPECT_EQ(ds.ValueOffset(3), 4);
    EXPECT_EQ(ds.ValueOffset(-1), -1);
    EXPECT_THROW(ds.ValueOffset(-2), ErrorText);
    EXPECT_THROW(ds.ValueOffset(6), ErrorText);
    EXPECT_THROW(ds.GetVariable(5), ErrorText);
    EXPECT_FALSE(ds.IsValidIndex(-1));

    QORA_Variable wide(20);
    ds.InsertVariable(0, wide);
    EXPECT_EQ(ds.GetVariable(0).GetID(), wide.GetID());
    EXPECT_EQ(ds.ValueOffset(1), 3);
    ExpectExactLayout(ds);
    ds.InsertVariable(ds.ColumnCount(), QORA_Variable(17));  // at the end
    EXPECT_EQ(ds.Layout().LastSize(), 3);
    ds.InsertVariable(2, QORA_Variable(0));
    ExpectExactLayout(ds);
    EXPECT_THROW(ds.InsertVariable(-1, QORA_Variable(0)), ErrorText);
    EXPECT_THROW(ds.InsertVariable(ds.ColumnCount() + 1, QORA_Variable(0)), ErrorText);
    EXPECT_THROW(ds.InsertVariable(0, QORA_Variable()), ErrorText);
    ExpectExactLayout(ds);
}

TEST(DataSourceTest, ReplaceWithAnotherWidthMovesLaterOffsets) {
    TestSource ds;
    AddVariables(ds, {0, 8, 0, 0});
    QORA_Variable wider = ds.GetVariable(1);
    wider.SetType(9);
    ds.ReplaceVariable(1, wider);
    EXPECT_EQ(ds.ValueOffset(2), 3);
    ExpectExactLayout(ds);
    QORA_Variable last = ds.GetVariable(3);
    for (int type : {300, 1}) {
        last.SetType(type);
        ds.ReplaceVariable(3, last);
        ExpectExactLayout(ds);
    }
    EXPECT_THROW(ds.ReplaceVariable(0, QORA_Variable(0)), ErrorText);  // another identity
    EXPECT_THROW(ds.ReplaceVariable(4, last), ErrorText);
    ExpectExactLayout(ds);
}

TEST(DataSourceTest, DeletesAtTheFrontMiddleAndEnd) {
    TestSource ds;
    AddVariables(ds, {0, 12, 0, 30, 9, 0});
    ds.DeleteVariables(0, 1);  // the front
    EXPECT_EQ(ds.GetVariable(0).GetName(), "v2");
    ExpectExactLayout(ds);
    ds.DeleteVariables(2, 3);  // the end
    EXPECT_EQ(ds.Layout().LastSize(), 4);
    ExpectExactLayout(ds);
    AddVariables(ds, {0, 20});
    ds.DeleteVariables(1, 2);  // the middle
    EXPECT_EQ(ds.GetVariable(1).GetType(), 20);
    ExpectExactLayout(ds);
    ds.DeleteVariables(1, 0);  // empty ranges
    ds.DeleteVariables(-5, -1);
    EXPECT_THROW(ds.DeleteVariables(0, 2), ErrorText);
    EXPECT_EQ(ds.ColumnCount(), 2);
    ds.DeleteVariables(0, 1);  // everything
    ExpectExactLayout(ds);
    AddVariables(ds, {3});
    ExpectExactLayout(ds);
}

TEST(DataSourceTest, FindVariableIgnoresCaseAndTrailingBlanks) {
    TestSource ds;
    AddVariables(ds, {0, 0, 0, 0});
    ds.GetVariable(0).SetName("AGE");
    ds.GetVariable(1).SetName("age");
    ds.GetVariable(2).SetName("");
    mbSetUtf8Mode(1);
    ds.GetVariable(3).SetName("caf\xC3\xA9");
    EXPECT_EQ(ds.FindVariable("CAF\xC3\x89 "), 3);  // whole characters upper-cased
    mbSetUtf8Mode(0);
    EXPECT_EQ(ds.FindVariable("age  "), 0);  // the first of two equal keys
    EXPECT_EQ(ds.FindVariable("   "), 2);
    EXPECT_EQ(ds.FindVariable(" age"), -1);
    EXPECT_EQ(ds.FindVariable("ag"), -1);
    EXPECT_EQ(ds.FindVariable("agexyz", 3), 0);
    const int32_t id = ds.GetVariable(1).GetID();
    ds.InsertVariable(0, QORA_Variable(4));
    EXPECT_EQ(ds.IndexOfID(id), 2);
    EXPECT_EQ(ds.IndexOfID(-1), -1);
}

TEST(DataSourceTest, WeightSurvivesReorderAndVanishesOnDelete) {
    TestSource ds;
    AddVariables(ds, {0, 0, 0});
    ds.SetCaseWeight(1);
    ds.InsertVariable(0, QORA_Variable(0));
    EXPECT_EQ(ds.GetCaseWeight(), 2);
    ds.DeleteVariables(0, 0);
    EXPECT_EQ(ds.GetCaseWeight(), 1);
    ds.DeleteVariables(1, 1);
    EXPECT_EQ(ds.GetCaseWeight(), -1);
    for (int bad : {-1, ds.ColumnCount()}) {
        ds.SetCaseWeight(0);
        ds.SetCaseWeight(bad);
        EXPECT_EQ(ds.GetCaseWeight(), -1);
    }
}

TEST(DataSourceTest, SplitSurvivesReorderAndClearsOnDelete) {
    TestSource ds;
    AddVariables(ds, {0, 0, 0, 0});
    const int indexes[] = {3, 1, 2};
    ds.SetSplitVars(3, indexes, true);
    EXPECT_TRUE(ds.IsSplitSorted());
    EXPECT_EQ(ds.SplitVarID(0), ds.GetVariable(3).GetID());
    ds.InsertVariable(0, QORA_Variable(0));
    EXPECT_EQ(ds.SplitVarIndex(0), 4);
    EXPECT_EQ(ds.SplitVarIndex(1), 2);
    EXPECT_THROW(ds.SplitVarIndex(3), ErrorText);
    EXPECT_THROW(ds.SplitVarID(3), ErrorText);
    ds.DeleteVariables(0, 0);  // not a split variable
    EXPECT_EQ(ds.SplitVarCount(), 3u);
    ds.DeleteVariables(1, 1);  // split variable 2 of 3
    EXPECT_EQ(ds.SplitVarCount(), 0u);
    EXPECT_FALSE(ds.IsSplitSorted());
}

TEST(DataSourceTest, SplitKeyIsAtMost64Bytes) {
    TestSource ds;
    AddVariables(ds, {0, 0, 0, 0, 0, 0, 0, 0, 9, 64, 65});
    const int numeric[] = {0, 1, 2, 3, 4, 5, 6, 7};
    ds.SetSplitVars(8, numeric, false);
    EXPECT_EQ(ds.SplitVarCount(), 8u);
    const int withString[] = {0, 1, 2, 3, 4, 5, 6, 8};
    EXPECT_THROW(ds.SetSplitVars(8, withString, true), ErrorText);
    EXPECT_EQ(ds.SplitVarIndex(7), 7);  // the refused split left the old one
    EXPECT_FALSE(ds.IsSplitSorted());
    const int longString[] = {9};
    ds.SetSplitVars(1, longString, true);
    EXPECT_EQ(ds.SplitVarIndex(0), 9);

    const std::vector<std::vector<int>> refused = {
        {10}, {9, 0}, {0, 1, 2, 3, 4, 5, 6, 7, 0}, {-1}, {11}};
    for (const auto& split : refused) {
        EXPECT_THROW(ds.SetSplitVars(int(split.size()), split.data(), true), ErrorText) << split[0];
    }
    ds.SetSplitVars(0, nullptr, true);
    EXPECT_EQ(ds.SplitVarCount(), 0u);
}

TEST(DataSourceTest, IdStringAbsentIsNotEmptyAndFileNameStamp) {
    TestSource ds;
    EXPECT_EQ(ds.GetIdString(), nullptr);
    ds.SetIdString("");
    TestSource copy(ds);
    ds.SetIdString(nullptr);
    EXPECT_EQ(ds.GetIdString(), nullptr);
    ASSERT_NE(copy.GetIdString(), nullptr);
    EXPECT_STREQ(copy.GetIdString(), "");

    ds.SetFileName(nullptr);
    EXPECT_EQ(ds.GetFileName(), "");
    // Made now: after 2020 on the scale that starts in October 1582.
    EXPECT_GT(ds.GetTimeStamp(), 13767465600.0);
    ds.SetTimeStamp(86400.0);
    ds.ResetTimeStamp();
    EXPECT_GT(ds.GetTimeStamp(), 13767465600.0);
}

TEST(DataSourceTest, ClearValuesBlanksStringsAndMarksNumbersMissing) {
    TestSource ds;
    AddVariables(ds, {0, 12, 0, 3});
    std::vector<unsigned char> buffer(8 * ds.ValueCount() + 8, 'z');
    auto text = [&](size_t from, size_t to) {
        return std::string(buffer.begin() + from, buffer.begin() + to);
    };
    ds.ClearValues(buffer.data(), 1, 2);
    EXPECT_EQ(text(0, 8), std::string(8, 'z'));
    EXPECT_EQ(text(8, 24), std::string(16, ' '));
    uint64_t bits;
    std::memcpy(&bits, &buffer[24], 8);
    EXPECT_EQ(bits, 0xFFEFFFFFFFFFFFFFull);
    EXPECT_EQ(text(32, 48), std::string(16, 'z'));
    ds.ClearValues(buffer.data(), 0, 4);
    EXPECT_EQ(text(32, 48), std::string(8, ' ') + std::string(8, 'z'));
    EXPECT_THROW(ds.ClearValues(buffer.data(), 3, 2), ErrorText);
    EXPECT_THROW(ds.ClearValues(buffer.data(), 1, 0x7FFFFFFF), ErrorText);
}

struct CountingObserver : QORA_DataSource::Observer {
    std::vector<int>* log;
    int id;
    CountingObserver(std::vector<int>* l, int i) : log(l), id(i) {}
    void IteratorCreated(QORA_InputCaseIterator*) override { log->push_back(id); }
};

TEST(DataSourceTest, ObserverAddedTwiceIsToldTwiceAndRemovedEverywhere) {
    TestSource ds;
    std::vector<int> log;
    CountingObserver a(&log, 1), b(&log, 2);
    ds.AddObserver(&a);
    ds.AddObserver(&b);
    ds.AddObserver(&a);
    ds.NotifyIteratorCreated(nullptr);
    EXPECT_EQ(log, (std::vector<int>{1, 2, 1}));
    ds.RemoveObserver(&a);
    log.clear();
    ds.NotifyIteratorCreated(nullptr);
    EXPECT_EQ(log, (std::vector<int>{2}));
}

TEST(DataSourceTest, CopiesShareVariablesUntilOneChanges) {
    TestSource ds;
    AddVariables(ds, {0, 10});
    ds.SetCaseWeight(0);
    ds.FileAttributes().Set("k", {"v"});
    TestSource copy(ds);
    EXPECT_EQ(copy.GetVariable(1).GetID(), ds.GetVariable(1).GetID());
    EXPECT_EQ(copy.FileAttributes().Size(), 1);
    copy.GetVariable(1).SetLabel("changed");
    EXPECT_EQ(ds.GetVariable(1).GetLabel(), nullptr);
    copy.DeleteVariables(0, 0);
    EXPECT_EQ(ds.ColumnCount(), 2);
    EXPECT_EQ(ds.GetCaseWeight(), 0);
    EXPECT_EQ(copy.GetCaseWeight(), -1);
    ExpectExactLayout(ds);
    ExpectExactLayout(copy);
}

TEST(DataSourceTest, ParentsAndAssignFrom) {
    TestSource parent;
    AddVariables(parent, {0, 20});
    parent.SetFileName("p.qsf");
    TestSource child(&parent);
    EXPECT_EQ(child.ValueCount(), 4);
    EXPECT_EQ(child.GetFileName(), "p.qsf");
    EXPECT_EQ(TestSource(child).GetParent(), &parent);  // a copy keeps the parent
    EXPECT_THROW(child.SetParent(&child), ErrorText);

    TestSource other;
    AddVariables(other, {0, 9});
    other.SetFileName("other.qsf");
    other.SetCaseWeight(1);
    child.SetIdString("old");
    child.AssignFrom(other);
    EXPECT_EQ(child.GetParent(), &parent);
    EXPECT_EQ(child.GetFileName(), "");
    EXPECT_EQ(child.GetCaseWeight(), 1);
    EXPECT_EQ(child.GetIdString(), nullptr);
    ExpectExactLayout(child);
}

TEST(DataSourceTest, CaseSizeIsBounded) {
    TestSource ds;
    EXPECT_FALSE(ds.HasRoomFor(-1));
    EXPECT_FALSE(ds.HasRoomFor(32768));
    const int widest = QORA_Variable::MAX_STRING_TYPE;  // 4096 units
    QORA_Variable var(widest);
    const int fit = QORA_DataSource::eMaxValueUnits / 4096;
    for (int i = 0; i < fit; ++i) ds.InsertVariable(ds.ColumnCount(), var);
    EXPECT_FALSE(ds.HasRoomFor(widest));
    const int rest = QORA_DataSource::eMaxValueUnits - ds.ValueCount();
    EXPECT_TRUE(ds.HasRoomFor(rest * 8));
    EXPECT_FALSE(ds.HasRoomFor(rest * 8 + 1));
    EXPECT_THROW(ds.AppendVariable(var), ErrorText);
    EXPECT_EQ(ds.ColumnCount(), fit);
    int index = -1;
    ds.NewVariable(0, &index);  // one unit short of full
    QORA_Variable widened = ds.GetVariable(index);
    widened.SetType(widest);
    EXPECT_THROW(ds.ReplaceVariable(index, widened), ErrorText);
    EXPECT_EQ(ds.ValueCount(), QORA_DataSource::eMaxValueUnits - rest + 1);
    ExpectExactLayout(ds);
}

}  // namespace
