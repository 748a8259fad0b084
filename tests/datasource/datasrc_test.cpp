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
    if (ds.ColumnCount() > 0) {
        EXPECT_EQ(layout.LastSize(), ds.GetVariable(ds.ColumnCount() - 1).ValueUnits());
    }
}

TEST(DataSourceTest, StartsEmpty) {
    TestSource ds;
    EXPECT_EQ(ds.ColumnCount(), 0);
    EXPECT_EQ(ds.ValueCount(), 0);
    EXPECT_EQ(ds.CaseCount(), -1);
    EXPECT_EQ(ds.GetCaseWeight(), -1);
    EXPECT_EQ(ds.SplitVarCount(), 0u);
    EXPECT_FALSE(ds.IsSplitSorted());
    EXPECT_EQ(ds.GetIdString(), nullptr);
    EXPECT_EQ(ds.GetParent(), nullptr);
    EXPECT_EQ(ds.FindVariable("a"), -1);
    EXPECT_EQ(ds.ExtensionTypeBound(), 22);
    EXPECT_EQ(ds.ValueOffset(-1), -1);
    EXPECT_EQ(ds.ValueOffset(0), 0);
    // Made now: after 2020 on the scale that starts in October 1582.
    EXPECT_GT(ds.GetTimeStamp(), 13767465600.0);
}

TEST(DataSourceTest, AppendsLayOutUnits) {
    TestSource ds;
    AddVariables(ds, {0, 12, 8, 9, 0});
    ExpectExactLayout(ds);
    EXPECT_EQ(ds.ValueOffset(1), 1);
    EXPECT_EQ(ds.ValueOffset(2), 3);
    EXPECT_EQ(ds.ValueOffset(3), 4);
    EXPECT_EQ(ds.ValueOffset(4), 6);
    EXPECT_EQ(ds.ValueCount(), 7);
    EXPECT_THROW(ds.ValueOffset(-2), ErrorText);
    EXPECT_THROW(ds.ValueOffset(6), ErrorText);
    EXPECT_THROW(ds.GetVariable(5), ErrorText);
    EXPECT_THROW(ds.GetVariable(-1), ErrorText);
    EXPECT_TRUE(ds.IsValidIndex(4));
    EXPECT_FALSE(ds.IsValidIndex(5));
    EXPECT_FALSE(ds.IsValidIndex(-1));
}

TEST(DataSourceTest, InsertMovesLaterOffsets) {
    TestSource ds;
    AddVariables(ds, {0, 0, 5});
    QORA_Variable wide(20);
    ds.InsertVariable(0, wide);
    EXPECT_EQ(ds.GetVariable(0).GetID(), wide.GetID());
    EXPECT_EQ(ds.ValueOffset(1), 3);
    EXPECT_EQ(ds.ValueOffset(3), 5);
    EXPECT_EQ(ds.ValueCount(), 6);
    ExpectExactLayout(ds);

    ds.InsertVariable(ds.ColumnCount(), QORA_Variable(17));  // at the end
    ExpectExactLayout(ds);
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
    EXPECT_EQ(ds.ValueOffset(3), 4);
    ExpectExactLayout(ds);

    QORA_Variable last = ds.GetVariable(3);
    last.SetType(300);
    ds.ReplaceVariable(3, last);
    ExpectExactLayout(ds);
    last.SetType(1);
    ds.ReplaceVariable(3, last);
    ExpectExactLayout(ds);

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
    EXPECT_EQ(ds.ColumnCount(), 2);
    EXPECT_EQ(ds.Layout().LastSize(), 4);
    ExpectExactLayout(ds);
    AddVariables(ds, {0, 20});
    ds.DeleteVariables(1, 2);  // the middle
    EXPECT_EQ(ds.GetVariable(1).GetType(), 20);
    ExpectExactLayout(ds);

    ds.DeleteVariables(1, 0);  // an empty range
    ds.DeleteVariables(-5, -1);
    EXPECT_EQ(ds.ColumnCount(), 2);
    EXPECT_THROW(ds.DeleteVariables(0, 2), ErrorText);
    EXPECT_EQ(ds.ColumnCount(), 2);

    ds.DeleteVariables(0, 1);  // everything, from the front
    EXPECT_EQ(ds.ColumnCount(), 0);
    EXPECT_EQ(ds.ValueCount(), 0);
    EXPECT_EQ(ds.Layout().LastSize(), 0);
    AddVariables(ds, {3});
    ExpectExactLayout(ds);
}

TEST(DataSourceTest, FindVariableIgnoresCaseAndTrailingBlanks) {
    TestSource ds;
    AddVariables(ds, {0, 0, 0});
    ds.GetVariable(0).SetName("AGE");
    ds.GetVariable(1).SetName("age");
    ds.GetVariable(2).SetName("");
    EXPECT_EQ(ds.FindVariable("age  "), 0);  // the first of two equal keys
    EXPECT_EQ(ds.FindVariable("Age"), 0);
    EXPECT_EQ(ds.FindVariable("   "), 2);
    EXPECT_EQ(ds.FindVariable(" age"), -1);
    EXPECT_EQ(ds.FindVariable("ag"), -1);
    EXPECT_EQ(ds.FindVariable("agexyz", 3), 0);
}

TEST(DataSourceTest, FindVariableUpperCasesWholeCharacters) {
    mbSetUtf8Mode(1);
    TestSource ds;
    AddVariables(ds, {0});
    ds.GetVariable(0).SetName("caf\xC3\xA9");
    EXPECT_EQ(ds.GetVariable(0).GetKey(), "CAF\xC3\x89");
    EXPECT_EQ(ds.FindVariable("CAF\xC3\x89 "), 0);
    mbSetUtf8Mode(0);
}

TEST(DataSourceTest, IndexOfIDFollowsTheVariable) {
    TestSource ds;
    AddVariables(ds, {0, 0});
    const int32_t id = ds.GetVariable(1).GetID();
    EXPECT_EQ(ds.IndexOfID(id), 1);
    ds.InsertVariable(0, QORA_Variable(4));
    EXPECT_EQ(ds.IndexOfID(id), 2);
    EXPECT_EQ(ds.IndexOfID(-1), -1);
}

TEST(DataSourceTest, WeightSurvivesReorderAndVanishesOnDelete) {
    TestSource ds;
    AddVariables(ds, {0, 0, 0});
    ds.SetCaseWeight(1);
    EXPECT_EQ(ds.GetCaseWeight(), 1);
    ds.InsertVariable(0, QORA_Variable(0));
    EXPECT_EQ(ds.GetCaseWeight(), 2);
    ds.DeleteVariables(0, 0);
    EXPECT_EQ(ds.GetCaseWeight(), 1);
    ds.DeleteVariables(1, 1);
    EXPECT_EQ(ds.GetCaseWeight(), -1);

    ds.SetCaseWeight(0);
    ds.SetCaseWeight(-1);
    EXPECT_EQ(ds.GetCaseWeight(), -1);
    ds.SetCaseWeight(0);
    ds.SetCaseWeight(ds.ColumnCount());
    EXPECT_EQ(ds.GetCaseWeight(), -1);
}

TEST(DataSourceTest, SplitSurvivesReorderAndClearsOnDelete) {
    TestSource ds;
    AddVariables(ds, {0, 0, 0, 0});
    const int indexes[] = {3, 1, 2};
    ds.SetSplitVars(3, indexes, true);
    EXPECT_EQ(ds.SplitVarCount(), 3u);
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
    EXPECT_EQ(ds.SplitVarCount(), 8u);  // the refused split left the old one
    EXPECT_EQ(ds.SplitVarIndex(7), 7);
    EXPECT_FALSE(ds.IsSplitSorted());

    const int longString[] = {9};
    ds.SetSplitVars(1, longString, true);
    EXPECT_EQ(ds.SplitVarIndex(0), 9);
    const int tooLong[] = {10};
    EXPECT_THROW(ds.SetSplitVars(1, tooLong, true), ErrorText);
    const int longPlusOne[] = {9, 0};
    EXPECT_THROW(ds.SetSplitVars(2, longPlusOne, true), ErrorText);
    const int nine[] = {0, 1, 2, 3, 4, 5, 6, 7, 0};
    EXPECT_THROW(ds.SetSplitVars(9, nine, true), ErrorText);
    const int bad[] = {-1};
    EXPECT_THROW(ds.SetSplitVars(1, bad, true), ErrorText);
    const int outside[] = {11};
    EXPECT_THROW(ds.SetSplitVars(1, outside, true), ErrorText);
    ds.SetSplitVars(0, nullptr, true);
    EXPECT_EQ(ds.SplitVarCount(), 0u);
}

TEST(DataSourceTest, IdStringAbsentIsNotEmpty) {
    TestSource ds;
    EXPECT_EQ(ds.GetIdString(), nullptr);
    ds.SetIdString("");
    ASSERT_NE(ds.GetIdString(), nullptr);
    EXPECT_STREQ(ds.GetIdString(), "");
    TestSource copy(ds);
    ASSERT_NE(copy.GetIdString(), nullptr);
    ds.SetIdString(nullptr);
    EXPECT_EQ(ds.GetIdString(), nullptr);
    EXPECT_STREQ(copy.GetIdString(), "");
}

TEST(DataSourceTest, FileNameAndTimeStamp) {
    TestSource ds;
    ds.SetFileName("/tmp/a.sav");
    EXPECT_EQ(ds.GetFileName(), "/tmp/a.sav");
    ds.SetFileName(nullptr);
    EXPECT_EQ(ds.GetFileName(), "");
    ds.SetTimeStamp(86400.0);
    EXPECT_EQ(ds.GetTimeStamp(), 86400.0);
    ds.ResetTimeStamp();
    EXPECT_GT(ds.GetTimeStamp(), 13767465600.0);
}

TEST(DataSourceTest, ClearValuesBlanksStringsAndMarksNumbersMissing) {
    TestSource ds;
    AddVariables(ds, {0, 12, 0, 3});
    std::vector<unsigned char> buffer(8 * ds.ValueCount() + 8, 'z');
    ds.ClearValues(buffer.data(), 1, 2);
    EXPECT_EQ(std::string(buffer.begin(), buffer.begin() + 8), std::string(8, 'z'));
    EXPECT_EQ(std::string(buffer.begin() + 8, buffer.begin() + 24), std::string(16, ' '));
    double x;
    std::memcpy(&x, &buffer[24], 8);
    uint64_t bits;
    std::memcpy(&bits, &x, 8);
    EXPECT_EQ(bits, 0xFFEFFFFFFFFFFFFFull);
    EXPECT_EQ(std::string(buffer.begin() + 32, buffer.end()), std::string(16, 'z'));
    ds.ClearValues(buffer.data(), 0, 4);
    EXPECT_EQ(std::string(buffer.begin() + 32, buffer.begin() + 40), std::string(8, ' '));
    EXPECT_EQ(buffer.back(), 'z');
    EXPECT_THROW(ds.ClearValues(buffer.data(), 3, 2), ErrorText);
    EXPECT_THROW(ds.ClearValues(buffer.data(), 1, 0x7FFFFFFF), ErrorText);
}

struct CountingObserver : QORA_DataSource::Observer {
    std::vector<int>* log;
    int id;
    CountingObserver(std::vector<int>* l, int i) : log(l), id(i) {}
    void IteratorCreated(QORA_InputCaseIterator*) override { log->push_back(id); }
};

TEST(DataSourceTest, ObserversAreToldInOrderAndRemovedEverywhere) {
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

TEST(DataSourceTest, ExtensionsGrowAndStaySeparateInCopies) {
    TestSource ds;
    const int32_t words[10] = {1, 2, 3, 4, 5, 6, 7, 8, 9, 10};
    ds.SetExtensionContent(30, 4, 10, words);
    EXPECT_TRUE(ds.HasExtension(30));
    EXPECT_FALSE(ds.HasExtension(29));
    EXPECT_EQ(ds.ExtensionTypeBound(), 30);
    EXPECT_EQ(ds.LastIntegerOfExtension(30), 10);
    EXPECT_EQ(ds.GetExtension(29).Impl()->ElementSize(), 1);  // an empty stand-in

    TestSource copy(ds);
    const int32_t more = 11;
    copy.AppendExtensionData(30, 1, &more);
    EXPECT_EQ(copy.LastIntegerOfExtension(30), 11);
    EXPECT_EQ(ds.LastIntegerOfExtension(30), 10);
    EXPECT_EQ(ds.GetExtension(30).Impl()->ElementCount(), 10);

    ds.SetExtensionContent(30, 4, 0, nullptr);
    EXPECT_FALSE(ds.HasExtension(30));
    EXPECT_EQ(ds.ExtensionTypeBound(), 30);
    EXPECT_TRUE(copy.HasExtension(30));
    EXPECT_THROW(ds.AppendExtensionData(30, 1, &more), ErrorText);
}

TEST(DataSourceTest, CopiesShareVariablesUntilOneChanges) {
    TestSource ds;
    AddVariables(ds, {0, 10});
    ds.SetCaseWeight(0);
    ds.SetIdString("id");
    ds.FileAttributes().Set("k", {"v"});
    TestSource copy(ds);
    EXPECT_EQ(copy.GetVariable(1).GetID(), ds.GetVariable(1).GetID());
    EXPECT_EQ(copy.GetCaseWeight(), 0);
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

TEST(DataSourceTest, ConstructionFromAParent) {
    TestSource parent;
    AddVariables(parent, {0, 20});
    parent.SetFileName("p.sav");
    TestSource child(&parent);
    EXPECT_EQ(child.GetParent(), &parent);
    EXPECT_EQ(child.ColumnCount(), 2);
    EXPECT_EQ(child.ValueCount(), 4);
    EXPECT_EQ(child.GetFileName(), "p.sav");
    TestSource grandChild(child);  // a copy keeps the parent pointer
    EXPECT_EQ(grandChild.GetParent(), &parent);
    TestSource orphan(nullptr);
    EXPECT_EQ(orphan.ColumnCount(), 0);
    EXPECT_THROW(child.SetParent(&child), ErrorText);
    child.SetParent(nullptr);
    EXPECT_EQ(child.GetParent(), nullptr);
}

TEST(DataSourceTest, AssignFromKeepsParentAndEmptiesFileName) {
    TestSource parent, other;
    AddVariables(other, {0, 9});
    other.SetFileName("other.sav");
    other.SetCaseWeight(1);
    other.SetIdString(nullptr);
    TestSource target(&parent);
    target.SetIdString("old");
    target.AssignFrom(other);
    EXPECT_EQ(target.GetParent(), &parent);
    EXPECT_EQ(target.GetFileName(), "");
    EXPECT_EQ(target.ColumnCount(), 2);
    EXPECT_EQ(target.GetCaseWeight(), 1);
    EXPECT_EQ(target.GetIdString(), nullptr);
    ExpectExactLayout(target);
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
