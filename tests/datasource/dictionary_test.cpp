// The dictionary without cases. Formats as a file or a caller gives them,
// judged against the variable's type and repaired only when asked; numeric
// missing values bit for bit; value labels whose string keys read as NaN. The
// case layout and the split after variables are deleted (the very long string
// records delete segments anywhere). The lines of the multiple response and
// variable sets records: forms written and read back, malformed lines, records
// merged, sets losing absent names. The text form of attributes as the records
// hold it: read, written, malformed and mangled, and multibyte names.
#include <gtest/gtest.h>

#include <cmath>
#include <limits>
#include <random>
#include <string>
#include <tuple>

#include "Attributes.h"
#include "api_handles.h"
#include "dictionary_source.h"
#include "dserror.h"
#include "specialvalues.h"
#include "sysfile_builder.h"
#include "valuelabelmap.h"
#include "variable.h"

using fixture::FromBits;

namespace {

using Set = QORA_VariableSet;

Set VariableSet(const char* name, std::initializer_list<const char*> variables) {
    Set set(Set::kVariableSet);
    set.SetName(name);
    for (const char* v : variables) set.AddVariable(v);
    return set;
}

std::string Parsed(std::string_view line) {
    const auto set = Set::Parse(line);
    return set ? Describe(*set) : "nothing";
}

bool Parse(Attributes& target, const std::string& text, size_t* pos = nullptr) {
    return target.FromText(text.data(), text.size(), pos);
}

}  // namespace

TEST(DataSourceTest, DeletesKeepTheLayoutExact) {
    DictionaryOnly ds;
    int index = -1;
    for (int type : {0, 12, 0, 30, 9, 0}) ds.NewVariable(type, &index);
    const int split[] = {4, 5};
    ds.SetSplitVars(2, split, true);
    // The front, the last two (the split goes), all but the first, the only one left.
    const std::tuple<int, int, uint32_t> deletes[] = {{0, 0, 2}, {3, 4, 0}, {1, 2, 0}, {0, 0, 0}};
    for (auto [first, last, splitCount] : deletes) {
        SCOPED_TRACE(first);
        ds.DeleteVariables(first, last);
        // The layout must equal the one recomputed from the variables' widths.
        const CaseLayout& layout = ds.Layout();
        int32_t offset = 0;
        for (int i = 0; i < ds.ColumnCount(); ++i) {
            EXPECT_EQ(layout.Offset(i), offset) << "variable " << i;
            offset += ds.GetVariable(i).ValueUnits();
        }
        EXPECT_EQ(layout.Total(), offset);
        const int n = ds.ColumnCount();
        EXPECT_EQ(layout.LastSize(), n ? ds.GetVariable(n - 1).ValueUnits() : 0);
        EXPECT_EQ(ds.SplitVarCount(), splitCount);
        EXPECT_EQ(ds.IsSplitSorted(), splitCount > 0);
    }
    EXPECT_EQ(ds.ColumnCount(), 0);
}

TEST(VariableSetLine, LinesGiveTheirFieldsOrNothing) {
    const char* lines[] = {
        // clang-format off
        "$a C 1 L x", "plain set without equals",  // no "="
        "$a=X 1 L x", "$a=", "$a=C1 L x",          // an unknown type, none, no blank after it
        "$a=E", "$a=E 1",                          // no blank after E, flag digits never end
        "$a=D0  0  x", "$a=D-1 1 0  x",            // a zero or signed value length
        "$a=D9 1 0  x", "$a=C 99 L x",             // a value or label longer than the line
        "$a=C 99999999999999999999999999 L x",     // a length beyond any integer
        "$a=C x L y", "$a=C  L y",                 // a length not a number, or empty
        "$a=C 1 Lx", "$a=C 1 L",                   // no blank, or nothing, after the label
        "$a=D1 1", "$a=D1 1x0  v",                 // nothing, or no blank, after the value
        // clang-format on
    };
    for (const char* line : lines) EXPECT_EQ(Parsed(line), "nothing") << line;
    // Flags, a left-out label that reads back empty, blanks and "=" in counted texts.
    const std::pair<const char*, const char*> good[] = {
        {"$d=E 11 1 1 0  tea\n", "2|$d|1||3|tea "},
        {"$d=D1 1 0  tea\n", "2|$d|1||0|tea "},
        {"$x=D10 yes please 8 a = b  c v1 v2\n", "2|$x|yes please|a = b  c|0|v1 v2 "}};
    for (auto [line, fields] : good) EXPECT_EQ(Parsed(line), fields) << line;
    // The length claims bytes that lie beyond the view's end in memory.
    const std::string memory = "$a=C 5 L xyz tail";
    EXPECT_EQ(Parsed(std::string_view(memory).substr(0, 10)), "nothing");
}

TEST(VariableSetPrune, RemovesUnknownNamesThenEmptySets) {
    DictionaryOnly source;
    for (const std::string& name : {std::string("age"), std::string(64, 'L')}) source.Add(0, name);
    const std::string longName = std::string(64, 'l') + "tail";  // matched on 64 bytes
    QORA_VariableSetList sets = {VariableSet("keep", {"AGE", "gone", longName.c_str()}),
                                 VariableSet("empty", {"nothing"}), VariableSet("whole", {"Age"})};
    EXPECT_TRUE(PruneVariableSets(sets, source));
    ASSERT_EQ(sets.size(), 2u);
    EXPECT_EQ(Describe(sets[0]), "0|keep|||0|AGE " + longName + " ");
    EXPECT_EQ(Describe(sets[1]), "0|whole|||0|Age ");
    EXPECT_FALSE(PruneVariableSets(sets, source));
}

TEST(VariableTest, ValidateFormat) {
    struct Row {
        int type, code, width, decimals, result;
        QORA_Format fixed;
    };
    const Row rows[] = {
        // clang-format off
        {0, 5, 8, 2, 0, {5, 8, 2}}, {0, 5, 50, 20, 2, {5, 40, 16}}, {0, 5, 0, 0, 2, {5, 1, 0}},
        {0, 1, 8, 0, 1, {5, 8, 2}}, {0, 2, 8, 0, 1, {5, 8, 2}}, {0, 0, 8, 0, 1, {5, 8, 2}},
        {0, 40, 8, 0, 1, {5, 8, 2}},
        {0, 6, 8, 0, 1, {5, 8, 2}},  // not in the numeric table
        {0, 20, 5, 0, 2, {20, 9, 0}}, {0, 20, 10, 2, 3, {20, 10, 0}},
        {0, 21, 12, 4, 3, {21, 12, 3}},
        {0, 22, 17, 1, 3, {22, 17, 0}},  // reserve above the width
        {0, 39, 8, 8, 0, {39, 8, 8}}, {0, 5, 8, -1, 3, {5, 8, 7}}, {0, 5, 30, 16, 0, {5, 30, 16}},
        {0, 5, 30, 17, 3, {5, 30, 16}}, {10, 1, 10, 0, 0, {1, 10, 0}},
        {10, 1, 12, 0, 2, {1, 10, 0}}, {10, 1, 10, 3, 3, {1, 10, 0}}, {10, 1, 12, 3, 2, {1, 10, 0}},
        {10, 2, 20, 0, 0, {2, 20, 0}}, {10, 2, 10, 0, 2, {2, 20, 0}},
        {20000, 2, 40000, 0, 1, {1, 20000, 0}}, {10, 5, 8, 2, 1, {1, 10, 0}},
        {-1, 99, 99, 99, 0, {99, 99, 99}},
        // clang-format on
    };
    for (const Row& r : rows) {
        SCOPED_TRACE(::testing::Message()
                     << r.type << " " << r.code << " " << r.width << " " << r.decimals);
        int code = r.code, width = r.width, decimals = r.decimals;
        EXPECT_EQ(QORA_Variable::ValidateFormat(r.type, code, width, decimals, false), r.result);
        EXPECT_EQ((QORA_Format{code, width, decimals}), (QORA_Format{r.code, r.width, r.decimals}));
        EXPECT_EQ(QORA_Variable::ValidateFormat(r.type, code, width, decimals, true), r.result);
        EXPECT_EQ((QORA_Format{code, width, decimals}), r.fixed);
    }
}

// Discrete values and system-missing match bit for bit, never a neighbour or
// the other zero; a range takes its ends and its open sides.
TEST(VariableTest, NumericMissingValues) {
    const double low = 1, high = 5, nine = 9, zero = 0, two = 2;
    QORA_Variable range(0), discrete(0), none(0), below(0), above(0);
    range.SetMissingRange(&low, &high, &nine);
    discrete.SetMissingNumbers(&zero, &two, nullptr);
    below.SetMissingRange(nullptr, &high, nullptr);
    above.SetMissingRange(&high, nullptr, nullptr);
    const double nan = std::numeric_limits<double>::quiet_NaN();
    const std::tuple<const QORA_Variable*, double, bool> rows[] = {
        // clang-format off
        {&range, 1.0, true}, {&range, 3.0, true}, {&range, 5.0, true}, {&range, 9.0, true},
        {&range, SysmisValue(), true}, {&range, 0.999, false}, {&range, 6.0, false},
        {&range, 8.0, false}, {&range, nan, false}, {&discrete, 0.0, true},
        {&discrete, -0.0, false}, {&discrete, 2.0, true}, {&discrete, 3.0, false},
        {&discrete, FromBits(0xFFEFFFFFFFFFFFFEull), false}, {&none, 0.0, false},
        {&none, FromBits(0xFFEFFFFFFFFFFFFFull), true}, {&below, -1e300, true},
        {&below, 6.0, false}, {&above, std::numeric_limits<double>::max(), true},
        {&above, 4.0, false},
        // clang-format on
    };
    for (const auto& [var, x, missing] : rows) EXPECT_EQ(var->IsMissing(&x), missing) << x;
}

TEST(VLMapTest, KeysThatReadAsNaNStayFindable) {
    // String chunks whose top bytes are FF read as NaNs; every key must still
    // be found and none stored twice.
    QORA_VLMap map(8);
    const char* texts[] = {"\xff\xff\xff\xff\xff\xff\xff\xff", "a\xff\xff\xff\xff\xff\xff\xff",
                           "abc\0\0\0\0\0", "\x01\x02\x03\x04\x05\x06\xf8\xff", "zzz\0\0\0\0\0"};
    for (int round = 0; round < 2; ++round)
        for (const char* t : texts) map.Insert(std::string(t, 8).data(), t);
    EXPECT_EQ(map.Count(), 5);
    for (const char* t : texts) {
        const std::string* label = map.Lookup(std::string(t, 8).data());
        ASSERT_NE(label, nullptr);
        EXPECT_EQ(*label, t);
    }
    map.Insert(std::nan(""), "nan");
    EXPECT_EQ(*map.Lookup(std::nan("")), "nan");
}

// Adding pairs at once is adding them one by one: a repeated key keeps its
// last label, with few pairs and with many, and a copy that shared the map
// keeps what it had.
TEST(VLMapTest, InsertAllIsInsertOneByOne) {
    for (int count : {3, 16, 17, 40}) {
        QORA_VLMap all(8), single(8);
        all.Insert("before", -1, "b");
        single.Insert("before", -1, "b");
        const QORA_VLMap copy = all;
        std::vector<QORA_VLMapImpl::Pair> pairs;
        for (int i = 0; i < count; ++i) {
            const std::string key = all.KeyFromText(std::to_string(i * 7 % 11).c_str(), -1);
            pairs.push_back({key, "l" + std::to_string(i)});
            single.Insert(key.data(), pairs.back().label);
        }
        all.InsertAll(pairs);
        EXPECT_TRUE(all == single) << count;
        EXPECT_EQ(copy.Count(), 1) << count;
    }
}

TEST(AttributesTest, TextFormBytesAndRoundTrip) {
    Attributes a;
    a.Set("Size", {"1", "2"});
    a.Set("Empty", {});
    a.Set("Note", {"line\nbreak", ""});
    const std::string text = a.ToText();
    EXPECT_EQ(text, "Size('1'\n'2'\n)Note('linebreak'\n''\n)");
    Attributes b;
    size_t pos = 99;
    ASSERT_TRUE(Parse(b, text, &pos));
    EXPECT_EQ(pos, text.size());
    EXPECT_EQ(b.ToText(), text);

    ASSERT_TRUE(Parse(b, "a('1'\n)/b('2'\n)", &pos));  // "/" ends the text
    EXPECT_EQ(pos, 7u);
    EXPECT_EQ(b.ToText(), "a('1'\n)");
    ASSERT_TRUE(Parse(b, std::string("a('x\0y'\n)", 9)));
    EXPECT_EQ(b.ValuesAt(0)[0], std::string("x\0y", 3));
    EXPECT_TRUE(b.FromText(nullptr, 5));
    EXPECT_EQ(b.Size(), 0);
    // Names failing the rules are dropped when reading.
    ASSERT_TRUE(Parse(b, "dot.('1'\n)under_('2'\n)9x('3'\n)$Own('4'\n)ok('5'\n)none()"));
    EXPECT_EQ(b.ToText(), "$Own('4'\n)ok('5'\n)");
}

TEST(AttributesTest, MalformedTextFailsAndLeavesTargetUnchanged) {
    // The text, and where the parse stopped.
    const std::pair<const char*, size_t> cases[] = {
        // clang-format off
        {"a('1\n)", 2}, {"a('1'", 2},          // no closing quote before the newline; no newline
        {"a('1'\n", 2}, {"a(", 0},             // the newline or "(" is the last byte
        {"('1'\n)", 0}, {"abc", 0},            // an empty name; no "("
        {"a(x'\n)", 2}, {"a('\n)", 2},         // no opening quote; a newline right after it
        {"a('1'\n'2'\n", 6}, {"a('1'\n)b", 7},  // no ")"; a trailing name without "("
        // clang-format on
    };
    for (const auto& [text, where] : cases) {
        SCOPED_TRACE(text);
        Attributes target;
        target.Set("kept", {"v"});
        size_t pos = 999;
        EXPECT_FALSE(Parse(target, text, &pos));
        EXPECT_EQ(pos, where);
        EXPECT_EQ(target.ToText(), "kept('v'\n)");
    }
}

TEST(AttributesTest, MangledTextNeverReadsOutside) {
    // Every prefix and random byte changes of a valid text: the parse either
    // succeeds or fails, within the bytes it was given (checked under ASan).
    Attributes source;
    source.Set("First", {"one", "two"});
    source.Set("$Sys", {"x"});
    const std::string good = source.ToText();
    std::mt19937 rng(7);
    const char alphabet[] = "()'\n/$a.";
    for (size_t round = 0; round < good.size() + 500; ++round) {
        std::string text = good.substr(0, std::min(round, good.size()));
        if (round > good.size())
            for (int k = 0; k < 3; ++k)
                text[rng() % text.size()] = alphabet[rng() % (sizeof alphabet - 1)];
        std::vector<char> bytes(text.begin(), text.end());  // exact size for ASan
        Attributes a;
        size_t pos = 0;
        a.FromText(bytes.data(), bytes.size(), &pos);
        EXPECT_LE(pos, bytes.size());
    }
}

TEST(AttributesTest, MultibyteNamesInUtf8Mode) {
    fixture::Utf8Mode utf8;
    auto check = [](const std::string& s) { return Attributes::CheckName(s.data(), s.size()); };
    EXPECT_EQ(check("\xc3\xa9t\xc3\xa9"), 0);
    EXPECT_EQ(check("a\xc3"), 4);  // a character cut short
    EXPECT_EQ(check("a\xa9"), 4);  // a stray trail byte
    Attributes a;
    EXPECT_TRUE(Parse(a, "\xc3\xa9t\xc3\xa9('1'\n)a\xc3('2'\n)"));
    EXPECT_EQ(a.Size(), 1);
    EXPECT_EQ(a.IndexOf("\xc3\x89T\xc3\x89"), 0);  // case ignored beyond ASCII
}
