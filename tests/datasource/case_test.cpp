#include "case.h"

#include <gtest/gtest.h>

#include <cmath>
#include <cstring>
#include <memory>
#include <string>

#include "CaseValue.h"
#include "dserror.h"
#include "memory_source.h"
#include "qoramb.h"
#include "specialvalues.h"

namespace {

// Layout: N (1 unit), S10 (2 units), S3 (1 unit), M (1 unit).
class CaseTest : public ::testing::Test {
  protected:
    CaseTest() {
        source.Add(0, "N");
        source.Add(10, "S10");
        source.Add(3, "S3");
        source.Add(0, "M");
    }
    ~CaseTest() override { mbSetUtf8Mode(0); }

    std::string Bytes(const QORA_Case& c, int index, size_t n) const {
        return std::string(static_cast<const char*>(c.ValuePointer(index)), n);
    }
    static double Number(const void* p) {
        double value;
        std::memcpy(&value, p, sizeof value);
        return value;
    }

    MemorySource source;
};

}  // namespace

TEST_F(CaseTest, StringFillsEveryUnitOfItsVariable) {
    QORA_Case c(source);
    c.ClearAll();
    c.SetNumeric(3, 42.0);
    c.SetString(1, "ABC");
    EXPECT_EQ(Bytes(c, 1, 16), "ABC" + std::string(13, ' '));
    EXPECT_EQ(Number(c.ValuePointer(3)), 42.0);  // the next units are untouched

    c.SetString(2, "ABCDEFGHIJKL", 12);
    EXPECT_EQ(Bytes(c, 2, 8), "ABC     ");
    c.SetString(1, "XYZ123", 2);
    EXPECT_EQ(Bytes(c, 1, 16), "XY" + std::string(14, ' '));
    c.SetString(1, nullptr);
    EXPECT_EQ(Bytes(c, 1, 16), std::string(16, ' '));
    EXPECT_THROW(c.SetString(0, "x"), ErrorText);
    EXPECT_THROW(c.SetNumeric(4, 1.0), ErrorText);
    EXPECT_THROW(c.SetNumeric(-1, 1.0), ErrorText);
    EXPECT_THROW(c.ValuePointer(-1), ErrorText);
}

TEST_F(CaseTest, StringIsCutAtAWholeCharacter) {
    mbSetUtf8Mode(1);
    QORA_Case c(source);
    // A 3-byte character at bytes 9 to 11 does not fit a width of 10.
    c.SetString(1, "123456789\xE2\x82\xAC");
    EXPECT_EQ(Bytes(c, 1, 16), "123456789" + std::string(7, ' '));
    // One at bytes 7 to 9 does fit.
    c.SetString(1, "1234567\xE2\x82\xAC");
    EXPECT_EQ(Bytes(c, 1, 16), "1234567\xE2\x82\xAC" + std::string(6, ' '));
    c.SetString(2, "ab\xC3\xA9");
    EXPECT_EQ(Bytes(c, 2, 8), "ab" + std::string(6, ' '));
}

TEST_F(CaseTest, ClearsARangeOrEverything) {
    QORA_Case c(source);
    std::memset(c.Buffer(), 'x', 5 * 8);
    c.Clear(1, 2);
    EXPECT_EQ(Bytes(c, 0, 8), std::string(8, 'x'));
    EXPECT_EQ(Bytes(c, 1, 24), std::string(24, ' '));
    EXPECT_EQ(Bytes(c, 3, 8), std::string(8, 'x'));
    c.ClearAll();
    EXPECT_EQ(Number(c.ValuePointer(0)), SysmisValue());
    EXPECT_EQ(Number(c.ValuePointer(3)), SysmisValue());
}

TEST_F(CaseTest, OwnsOnlyTheBufferItMade) {
    {
        QORA_Case c(source);
        EXPECT_TRUE(c.OwnsBuffer());
        EXPECT_EQ(Bytes(c, 0, 40), std::string(40, '\0'));
    }
    auto buffer = std::make_unique<double[]>(5);
    {
        QORA_Case c(source, buffer.get());
        EXPECT_FALSE(c.OwnsBuffer());
        EXPECT_EQ(c.Buffer(), buffer.get());
        c.SetNumeric(3, 7.5);
    }
    EXPECT_EQ(buffer[4], 7.5);  // still there, and still ours to free
}

TEST_F(CaseTest, CaseValueSetsThroughTheIterator) {
    std::unique_ptr<QORA_InputCaseIterator> it(source.NewIterator(nullptr));
    CaseValue number(*it, 0);
    CaseValue text(*it, 1);

    const double v = 3.25;
    number.SetRaw(&v);
    EXPECT_EQ(Number(it->ValuePointer(0)), 3.25);
    number.SetNumeric(-1.0);
    EXPECT_EQ(Number(it->ValuePointer(0)), -1.0);

    std::memset(it->ValuePointer(1), 'x', 16);
    text.SetRaw("0123456789garbage");
    EXPECT_EQ(Bytes(it->Case(), 1, 16), "0123456789      ");
    std::memset(it->ValuePointer(1), 'x', 16);
    text.SetString("short");
    EXPECT_EQ(Bytes(it->Case(), 1, 16), "short           ");

    EXPECT_THROW(number.SetString("x"), ErrorText);
    EXPECT_THROW(text.SetNumeric(1.0), ErrorText);
    CaseValue detached(2);
    EXPECT_EQ(detached.Value(), nullptr);
    EXPECT_THROW(detached.SetRaw(&v), ErrorText);
}

TEST_F(CaseTest, CaseValueTellsSysmisBlankAndMissing) {
    std::unique_ptr<QORA_InputCaseIterator> it(source.NewIterator(nullptr));
    const double nine = 9.0;
    source.GetVariable(3).SetMissingNumbers(&nine, nullptr, nullptr);
    CaseValue number(*it, 3);
    CaseValue text(*it, 2);

    number.SetNumeric(SysmisValue());
    EXPECT_TRUE(number.IsSysmisOrBlank());
    EXPECT_TRUE(number.IsMissing());
    number.SetNumeric(std::nan(""));
    EXPECT_FALSE(number.IsSysmisOrBlank());
    number.SetNumeric(9.0);
    EXPECT_FALSE(number.IsSysmisOrBlank());
    EXPECT_TRUE(number.IsMissing());
    number.SetNumeric(0.0);
    EXPECT_FALSE(number.IsMissing());

    text.SetString("");
    EXPECT_TRUE(text.IsSysmisOrBlank());
    text.SetRaw("  \0");
    EXPECT_FALSE(text.IsSysmisOrBlank());
}

TEST_F(CaseTest, CaseValueFollowsTheIteratorToTheNextCase) {
    source.AddRow([](QORA_Case& row) { row.SetNumeric(0, 1.0); });
    source.AddRow([](QORA_Case& row) { row.SetNumeric(0, 2.0); });
    double buffer[5];
    std::unique_ptr<QORA_InputCaseIterator> it(source.NewIterator(buffer));
    CaseValue value(0);
    value.Refresh(*it);
    ASSERT_TRUE(it->ReadCase());
    EXPECT_EQ(Number(value.Value()), 1.0);
    ASSERT_TRUE(it->ReadCase());
    value.Refresh(*it);
    EXPECT_EQ(Number(value.Value()), 2.0);
    EXPECT_EQ(value.Value(), &buffer[0]);
}
