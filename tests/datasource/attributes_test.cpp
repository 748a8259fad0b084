// The text form of attributes as the records hold it: read, written, malformed
// and mangled, and multibyte names.
#include "Attributes.h"

#include <gtest/gtest.h>

#include <random>

#include "qoramb.h"

namespace {

bool Parse(Attributes& target, const std::string& text, size_t* pos = nullptr) {
    return target.FromText(text.data(), text.size(), pos);
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
    EXPECT_EQ(b.Size(), 1);
    ASSERT_TRUE(Parse(b, std::string("a('x\0y'\n)", 9)));
    EXPECT_EQ(b.ValuesAt(0)[0], std::string("x\0y", 3));
    EXPECT_TRUE(b.FromText(nullptr, 5));
    EXPECT_EQ(b.Size(), 0);
    // Names failing the rules are dropped when reading.
    ASSERT_TRUE(Parse(b, "dot.('1'\n)under_('2'\n)9x('3'\n)$Own('4'\n)ok('5'\n)none()"));
    ASSERT_EQ(b.Size(), 2);
    EXPECT_EQ(b.NameAt(0), "$Own");
    EXPECT_EQ(b.NameAt(1), "ok");
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
        ASSERT_EQ(target.Size(), 1);
        EXPECT_EQ(target.NameAt(0), "kept");
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
    const int saved = mbIsUtf8Mode();
    mbSetUtf8Mode(1);
    auto check = [](const std::string& s) { return Attributes::CheckName(s.data(), s.size()); };
    EXPECT_EQ(check("\xc3\xa9t\xc3\xa9"), 0);
    EXPECT_EQ(check("a\xc3"), 4);  // a character cut short
    EXPECT_EQ(check("a\xa9"), 4);  // a stray trail byte
    Attributes a;
    EXPECT_TRUE(Parse(a, "\xc3\xa9t\xc3\xa9('1'\n)a\xc3('2'\n)"));
    EXPECT_EQ(a.Size(), 1);
    EXPECT_EQ(a.IndexOf("\xc3\x89T\xc3\x89"), 0);  // case ignored beyond ASCII
    mbSetUtf8Mode(saved);
}

}  // namespace
