#include "HeaderSettings.h"

#include <gtest/gtest.h>

#include <cstring>

#include "datasrc.h"
#include "specialvalues.h"

namespace {

// The stamp of a date and time field pair, or -1 when they are rejected.
double Stamp(const char* date, const char* time) {
    double stamp = -1.0;
    return ParseCreationStamp(date, time, &stamp) ? stamp : -1.0;
}

}  // namespace

TEST(CreationStamp, CountsSecondsFromTheGregorianStart) {
    EXPECT_EQ(Stamp("04 Dec 26", "17:16:43"), 14015783803.0);
    EXPECT_EQ(Stamp("04 DEC 69", "17:16:43"), 15372782203.0);  // 00-69: 2000s
    EXPECT_EQ(Stamp("04 dec 70", "17:16:43"), 12248558203.0);  // 70-99: 1900s
    EXPECT_EQ(Stamp("29 Feb 00", "00:00:00"), 13171161600.0);
}

TEST(CreationStamp, RejectsWhatIsNoDateOrTime) {
    EXPECT_EQ(Stamp(" 4 Dec 26", "17:16:43"), -1.0);  // a blank is no digit
    EXPECT_EQ(Stamp("04 Xyz 26", "17:16:43"), -1.0);
    EXPECT_EQ(Stamp("00 Dec 26", "17:16:43"), -1.0);
    EXPECT_EQ(Stamp("32 Dec 26", "17:16:43"), -1.0);
    EXPECT_EQ(Stamp("04 Dec 26", "24:00:00"), -1.0);
    EXPECT_EQ(Stamp("04 Dec 26", "23:60:00"), -1.0);
    EXPECT_EQ(Stamp("04 Dec 26", "23:59:60"), -1.0);
    EXPECT_EQ(Stamp("\0\0\0\0\0\0\0\0\0", "\0\0\0\0\0\0\0\0"), -1.0);
    // A day beyond its month's length is taken as it stands.
    EXPECT_GT(Stamp("31 Feb 26", "00:00:00"), 0.0);
}

TEST(HeaderSettings, StartsWithTheLibraryDefaults) {
    const HeaderSettings s;
    EXPECT_EQ(s.fBias, 100.0);
    EXPECT_EQ(s.fSysmis, SysmisValue());
    EXPECT_EQ(s.fLowest, LowestValue());
    EXPECT_EQ(s.fCaseCount, -1);
    EXPECT_EQ(s.fCaseSize, -1);
    EXPECT_EQ(s.fProduct, "@(#) QORA DATA FILE MS Windows Release 16.0.0");
    EXPECT_EQ(s.fMachineCode, 720);
    EXPECT_EQ(s.fCharacterCode, 2);
    EXPECT_TRUE(s.fRecordsSeen.none());
    EXPECT_TRUE(s.fSwapMask.empty());
    EXPECT_FALSE(s.fSwapped || s.fCompressed || s.fLongNamesSeen);
}

TEST(HeaderSettings, SeenFlagsCoverSubtypesBelowAHundred) {
    HeaderSettings s;
    s.NoteSeen(99);
    s.NoteSeen(100);
    s.NoteSeen(-1);
    EXPECT_TRUE(s.HasSeen(99));
    EXPECT_FALSE(s.HasSeen(100));
    EXPECT_FALSE(s.HasSeen(-1));
    EXPECT_EQ(s.fRecordsSeen.count(), 1u);
}

TEST(HeaderSettings, SwapMaskMarksTheUnitOfEveryNumber) {
    class Source : public QORA_DataSource {
        QORA_InputCaseIterator* NewIterator(void*) override { return nullptr; }
    } source;
    source.AppendVariable(QORA_Variable(0));
    source.AppendVariable(QORA_Variable(20));  // 3 units
    source.AppendVariable(QORA_Variable(0));
    source.AppendVariable(QORA_Variable(8));
    HeaderSettings s;
    s.BuildSwapMask(source);
    EXPECT_EQ(s.fSwapMask, (std::vector<uint8_t>{1, 0, 0, 0, 1, 0}));
}

TEST(HeaderSettings, SwappingReversesBytes) {
    EXPECT_EQ(SwapInt32(0x01020304), 0x04030201);
    double one = 1.0;
    const double swapped = SwapDouble(one);
    unsigned char a[8], b[8];
    std::memcpy(a, &one, 8);
    std::memcpy(b, &swapped, 8);
    for (int i = 0; i < 8; ++i) EXPECT_EQ(a[i], b[7 - i]);
    EXPECT_EQ(SwapDouble(swapped), 1.0);
}
