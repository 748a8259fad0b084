#include "Attributes.h"

#include <gtest/gtest.h>

#include <random>

#include "dserror.h"
#include "qoramb.h"

namespace {

bool Parse(Attributes& target, const std::string& text, size_t* pos = nullptr) {
    return target.FromText(text.data(), text.size(), pos);
}

TEST(AttributesTest, SetIgnoresCaseAndKeepsLatestSpelling) {
    Attributes a;
    a.Set("Size", {"1"});
    a.Set("Colour", {"red"});
    a.Set("SIZE", {"2", "3"});
    ASSERT_EQ(a.Size(), 2);
    EXPECT_EQ(a.NameAt(0), "SIZE");
    EXPECT_EQ(a.ValuesAt(0), (Attributes::Values{"2", "3"}));
    EXPECT_EQ(a.IndexOf("colour"), 1);
    EXPECT_EQ(a.IndexOf("none"), -1);
    EXPECT_TRUE(a.ValuesOf("none").empty());
    EXPECT_THROW(a.NameAt(2), ErrorText);
    EXPECT_THROW(a.ValuesAt(-1), ErrorText);
    EXPECT_THROW(a.RemoveAt(2), ErrorText);
}

TEST(AttributesTest, RemovingTheLastEntryEmptiesTheSet) {
    Attributes a;
    a.Set("x", {"1"});
    EXPECT_FALSE(a.Remove("y"));
    EXPECT_TRUE(a.Remove("X"));
    EXPECT_EQ(a.Size(), 0);
    EXPECT_TRUE(a == Attributes());
    EXPECT_EQ(a.ToText(), "");
}

TEST(AttributesTest, ChangeCountFollowsEveryChangeAndCopies) {
    Attributes a;
    EXPECT_EQ(Attributes(a).ChangeCount(), 0u);
    a.Set("x", {"1"});
    a.Set("y", {"2"});
    a.Remove("y");
    EXPECT_EQ(a.ChangeCount(), 3u);
    Attributes copy(a);
    EXPECT_EQ(copy.ChangeCount(), 4u);
    copy.Assign(Attributes());
    EXPECT_EQ(copy.Size(), 0);
    EXPECT_EQ(copy.ChangeCount(), 5u);
    copy = a;
    EXPECT_TRUE(copy == a);
    EXPECT_EQ(copy.ChangeCount(), 6u);
}

TEST(AttributesTest, EqualityCountsCaseAndOrder) {
    Attributes a, b;
    a.Set("x", {"1"});
    b.Set("X", {"1"});
    EXPECT_FALSE(a == b);
    b.Set("x", {"1"});
    EXPECT_TRUE(a == b);
    a.Set("y", {"1"});
    b.Set("y", {"1", "2"});
    EXPECT_TRUE(a != b);
    EXPECT_FALSE(a == Attributes());
}

TEST(AttributesTest, MergeAddsAbsentAndReplacesOnlyWhenAsked) {
    Attributes a, b;
    a.Set("keep", {"old"});
    b.Set("KEEP", {"new"});
    b.Set("add", {"1"});
    EXPECT_TRUE(a.Merge(b, false));
    EXPECT_EQ(a.ValuesOf("keep"), (Attributes::Values{"old"}));
    EXPECT_EQ(a.Size(), 2);
    EXPECT_FALSE(a.Merge(b, false));
    EXPECT_TRUE(a.Merge(b, true));
    EXPECT_EQ(a.ValuesOf("keep"), (Attributes::Values{"new"}));
    EXPECT_FALSE(a.Merge(b, true));
}

TEST(AttributesTest, TextFormBytesAndRoundTrip) {
    Attributes a;
    a.Set("Size", {"1", "2"});
    a.Set("Empty", {});
    a.Set("Note", {"line\nbreak", ""});
    std::string text = a.ToText();
    EXPECT_EQ(text, "Size('1'\n'2'\n)Note('linebreak'\n''\n)");
    Attributes b;
    size_t pos = 99;
    ASSERT_TRUE(Parse(b, text, &pos));
    EXPECT_EQ(pos, text.size());
    ASSERT_EQ(b.Size(), 2);
    EXPECT_EQ(b.ValuesOf("Note"), (Attributes::Values{"linebreak", ""}));
    EXPECT_EQ(b.ToText(), text);
}

TEST(AttributesTest, SlashEndsTheTextAndReportsItsPosition) {
    Attributes a;
    size_t pos = 0;
    ASSERT_TRUE(Parse(a, "a('1'\n)/b('2'\n)", &pos));
    EXPECT_EQ(pos, 7u);
    EXPECT_EQ(a.Size(), 1);
    ASSERT_TRUE(Parse(a, "", &pos));
    EXPECT_EQ(pos, 0u);
    EXPECT_EQ(a.Size(), 0);
}

TEST(AttributesTest, NamesFailingTheRulesAreDroppedWhenReading) {
    Attributes a;
    ASSERT_TRUE(Parse(a, "dot.('1'\n)under_('2'\n)9x('3'\n)$Own('4'\n)ok('5'\n)none()"));
    ASSERT_EQ(a.Size(), 2);
    EXPECT_EQ(a.NameAt(0), "$Own");
    EXPECT_EQ(a.NameAt(1), "ok");
}

TEST(AttributesTest, MalformedTextFailsAndLeavesTargetUnchanged) {
    const std::pair<const char*, size_t> cases[] = {
        {"a('1\n)", 2},       // no closing quote before the newline
        {"a('1'", 2},         // no newline
        {"a('1'\n", 2},       // newline is the last byte
        {"a(", 0},            // "(" is the last byte
        {"('1'\n)", 0},       // empty name
        {"abc", 0},           // no "("
        {"a(x'\n)", 2},       // value without opening quote
        {"a('\n)", 2},        // newline right after the quote
        {"a('1'\n'2'\n", 6},  // no ")"
        {"a('1'\n)b", 7},     // trailing name without "("
    };
    for (const auto& [text, where] : cases) {
        Attributes target;
        target.Set("kept", {"v"});
        size_t pos = 999;
        EXPECT_FALSE(Parse(target, text, &pos)) << text;
        EXPECT_EQ(pos, where) << text;
        EXPECT_EQ(target.Size(), 1) << text;
        EXPECT_EQ(target.NameAt(0), "kept");
    }
}

TEST(AttributesTest, ZeroBytesAndNullTextAreSafe) {
    Attributes a;
    std::string text("a('x\0y'\n)", 9);
    ASSERT_TRUE(Parse(a, text));
    EXPECT_EQ(a.ValuesAt(0)[0], std::string("x\0y", 3));
    EXPECT_TRUE(a.FromText(nullptr, 5));
    EXPECT_EQ(a.Size(), 0);
}

TEST(AttributesTest, MangledTextNeverReadsOutside) {
    // Every prefix and random byte changes of a valid text: the parse either
    // succeeds or fails, within the bytes it was given (checked under ASan).
    Attributes source;
    source.Set("First", {"one", "two"});
    source.Set("$Sys", {"x"});
    const std::string good = source.ToText();
    for (size_t n = 0; n <= good.size(); ++n) {
        std::vector<char> bytes(good.begin(), good.begin() + n);
        Attributes a;
        size_t pos = 0;
        a.FromText(bytes.data(), bytes.size(), &pos);
        EXPECT_LE(pos, n);
    }
    std::mt19937 rng(7);
    const char alphabet[] = "()'\n/$a.";
    for (int round = 0; round < 2000; ++round) {
        std::string text = good;
        for (int k = 0; k < 3; ++k)
            text[rng() % text.size()] = alphabet[rng() % (sizeof alphabet - 1)];
        std::vector<char> bytes(text.begin(), text.end());
        Attributes a;
        size_t pos = 0;
        a.FromText(bytes.data(), bytes.size(), &pos);
        EXPECT_LE(pos, bytes.size());
    }
}

TEST(AttributesTest, NameRulesAndClasses) {
    auto check = [](const std::string& s) { return Attributes::CheckName(s.data(), s.size()); };
    EXPECT_EQ(check("age"), 0);
    EXPECT_EQ(check("age   "), 0);
    EXPECT_EQ(check(""), 3);
    EXPECT_EQ(check(std::string(65, 'a')), 3);
    EXPECT_EQ(check(std::string(64, 'a')), 0);
    EXPECT_EQ(check("a b"), 4);
    EXPECT_EQ(check(std::string("a\0b", 3)), 4);
    EXPECT_EQ(check("and"), 5);
    EXPECT_EQ(check("WITHX"), 0);
    EXPECT_EQ(check("_a"), 6);
    EXPECT_EQ(check("#a"), 1);
    EXPECT_EQ(check("$a."), 2);
    EXPECT_EQ(check("a."), 7);
    EXPECT_EQ(check("a_"), 100);
    EXPECT_EQ(check("a.b_c"), 0);

    auto cls = [](const std::string& s, bool var) {
        return Attributes::ClassifyName(s.data(), s.size(), var);
    };
    EXPECT_EQ(cls("age", true), 1);
    EXPECT_EQ(cls("$ODBC.Type", true), 2);
    EXPECT_EQ(cls("$odbc.type", true), 2);
    EXPECT_EQ(cls("$ODBC.Type", false), 3);
    EXPECT_EQ(cls("$ExtendedFileLabel", false), 2);
    EXPECT_EQ(cls("$Unknown", true), 3);
    EXPECT_EQ(cls("#scratch", true), 0);
    EXPECT_EQ(cls("age.", false), 0);
    EXPECT_EQ(Attributes::VariableReservedNames().size(), 14u);
    EXPECT_EQ(Attributes::FileReservedNames().size(), 9u);
}

TEST(AttributesTest, PresentedNamesOfArrays) {
    EXPECT_EQ(Attributes::PresentedName("Size", 1, 1), "Size");
    EXPECT_EQ(Attributes::PresentedName("Size", 7, 12), "Size[07]");
    EXPECT_EQ(Attributes::PresentedName("Size", 12, 12), "Size[12]");
    EXPECT_EQ(Attributes::PresentedName("Size", 5, 100), "Size[005]");
    EXPECT_EQ(Attributes::PresentedName("Size", 2, 9), "Size[2]");
}

}  // namespace

namespace {

// Runs a check in UTF-8 mode and restores the interface encoding after it.
struct Utf8Mode {
    int saved = mbIsUtf8Mode();
    Utf8Mode() { mbSetUtf8Mode(1); }
    ~Utf8Mode() { mbSetUtf8Mode(saved); }
};

TEST(AttributesTest, MultibyteNamesInUtf8Mode) {
    Utf8Mode utf8;
    auto check = [](const std::string& s) { return Attributes::CheckName(s.data(), s.size()); };
    EXPECT_EQ(check("\xc3\xa9t\xc3\xa9"), 0);
    EXPECT_EQ(check("a\xc3"), 4);  // a character cut short
    EXPECT_EQ(check("a\xa9"), 4);  // a stray trail byte
    Attributes a;
    ASSERT_TRUE(Parse(a, "\xc3\xa9t\xc3\xa9('1'\n)a\xc3('2'\n)"));
    ASSERT_EQ(a.Size(), 1);
    EXPECT_EQ(a.IndexOf("\xc3\x89T\xc3\x89"), 0);  // case ignored beyond ASCII
}

}  // namespace
