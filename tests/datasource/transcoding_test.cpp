// The view the opening factory puts over a file in another encoding than the
// interface's: widths, shared maps, numbers bit for bit, cuts at whole
// characters, repaired names and the warning.
#include <gtest/gtest.h>

#include <cstring>
#include <memory>
#include <string>
#include <vector>

#include "SystemFileDataSource.h"
#include "encoding_scope.h"
#include "sysfile_builder.h"

using namespace fixture;

namespace {

struct Warnings : WarningSink {
    std::vector<long> numbers;
    void Warning(long number, const std::string&) override { numbers.push_back(number); }
};

std::string Repeat(const std::string& text, int n) {
    std::string out;
    while (n-- > 0) out += text;
    return out;
}

TEST(Transcoding, CodePageFileSeenInUtf8) {
    EncodingScope scope(kUtf8);
    const std::string zhong = "\xD6\xD0", zhongUtf8 = "\xE4\xB8\xAD";  // one character
    SysFileBuilder b;
    b.String("S10", 10).LongName(Repeat(zhong, 32));
    b.String("T10", 10).LongName(Repeat(zhong, 31) + "ab");  // the same once cut to 64 bytes
    b.String("HUGE", 20000);
    b.Numeric("N1");
    b.Numeric("N2");
    b.String("BAD", 4).LongName("A\x81\x7F");  // no character in GBK
    b.ValueLabels({{"abc", zhong}}, {b.Slot("S10"), b.Slot("T10")});
    b.LongNames().VeryLongStrings().Encoding("GBK");
    const double odd = FromBits(0x7FF8000000000001);
    b.Case({Repeat(zhong, 5), Repeat(zhong, 4) + "\xD6", "h", 1.0, odd, zhong + "\xD6"});
    Warnings warnings;
    const auto source = OpenForReading(b.WriteTemp().c_str(), &warnings);
    EXPECT_EQ(warnings.numbers, std::vector<long>{kWarnNotUtf8});
    std::string names;
    for (int i = 0; i < source->ColumnCount(); ++i)
        names += source->GetVariable(i).GetName() + "/" +
                 std::to_string(source->GetVariable(i).GetType()) + " ";
    // The malformed name is renamed as the file is read, the repeated one
    // after the conversion.
    EXPECT_EQ(names, Repeat(zhongUtf8, 21) + "/30 v2/30 HUGE/32767 N1/0 N2/0 v1/12 ");
    const QORA_VLMap labels = source->GetVariable(0).GetValueLabels();
    EXPECT_TRUE(labels.SameObject(source->GetVariable(1).GetValueLabels()));
    ASSERT_NE(labels.Lookup("abc", 3), nullptr);
    EXPECT_EQ(*labels.Lookup("abc", 3), zhongUtf8);

    const std::unique_ptr<QORA_InputCaseIterator> it(source->NewIterator(nullptr));
    ASSERT_TRUE(it->ReadCase());
    auto Value = [&](int index, size_t bytes) {
        return std::string(static_cast<const char*>(it->ValuePointer(index)), bytes);
    };
    EXPECT_EQ(Value(0, 32), Repeat(zhongUtf8, 5) + std::string(17, ' '));
    // A malformed byte is shown as "?"; a value never passes its units.
    EXPECT_EQ(Value(1, 32), Repeat(zhongUtf8, 4) + "?" + std::string(19, ' '));
    EXPECT_EQ(std::memcmp(it->ValuePointer(4), &odd, 8), 0);
    EXPECT_EQ(Value(5, 16), zhongUtf8 + "?" + std::string(12, ' '));
}

}  // namespace
