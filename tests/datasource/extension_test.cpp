#include "extension.h"

#include <gtest/gtest.h>

#include <cstring>

namespace {

TEST(ExtensionTest, StoringGrowsTheListOnlyForNonEmptyRecords) {
    QORA_ExtensionList list;
    EXPECT_EQ(list.TypeBound(), 22);
    int32_t data[10] = {0};
    list.SetContent(30, 4, 10, data);
    EXPECT_EQ(list.TypeBound(), 30);
    for (int t = -1; t <= 31; ++t) EXPECT_EQ(list.HasExtension(t), t == 30) << t;
    // Clearing never lengthens and never shrinks the list.
    list.SetContent(40, 1, 0, nullptr);
    list.SetContent(30, 1, 0, nullptr);
    EXPECT_FALSE(list.HasExtension(30));
    EXPECT_EQ(list.TypeBound(), 30);
    // An absent type answers an empty stand-in.
    QORA_Extension record = list.Get(7);
    ASSERT_TRUE(record.IsValid());
    EXPECT_TRUE(record.IsEmpty());
    EXPECT_EQ(record.Impl()->Type(), 7);
    EXPECT_EQ(list.LastIntegerOf(7), 0);
    QORA_ExtensionReader none{QORA_Extension()};
    char buffer[8];
    EXPECT_EQ(none.Type(), -1);
    EXPECT_EQ(none.Read(buffer, 8), 0);
}

TEST(ExtensionTest, ReaderReturnsWholeElementsOnly) {
    const char bytes[] = "0123456789";
    QORA_Extension record(new QORA_ExtensionImpl(9, 4, std::string(bytes, 10)));
    QORA_ExtensionReader reader(record);
    EXPECT_EQ(reader.ElementCount(), 2);
    char buffer[100] = {0};
    EXPECT_EQ(reader.Read(buffer, 3), 0);
    EXPECT_EQ(reader.Read(buffer, 100), 2);
    EXPECT_EQ(std::string(buffer), "01234567");
    EXPECT_EQ(reader.Read(buffer, 100), 0);
    EXPECT_EQ(reader.Read(buffer, -4), 0);
}

TEST(ExtensionTest, LastIntegerAndElementSize) {
    QORA_ExtensionList list;
    const unsigned char bytes[] = {9, 9, 1, 0, 0, 0};
    list.SetContent(3, 1, 6, bytes);
    EXPECT_EQ(list.LastIntegerOf(3), 1);
    const unsigned char negative[] = {0xfe, 0xff, 0xff, 0xff};
    list.SetContent(3, 1, 4, negative);
    EXPECT_EQ(list.LastIntegerOf(3), -2);
    list.SetContent(3, 1, 3, bytes);
    EXPECT_EQ(list.LastIntegerOf(3), 0);
    list.SetContent(4, 0, 2, bytes);
    EXPECT_EQ(list.Get(4).Impl()->ElementSize(), 1);
    EXPECT_EQ(list.Get(4).Impl()->ElementCount(), 2);
}

TEST(ExtensionTest, AppendingToASharedRecordChangesOnlyOneList) {
    QORA_ExtensionList first;
    first.SetContent(0, 1, 3, "abc");
    QORA_ExtensionList second = first;
    EXPECT_TRUE(first.Get(0).SameObject(second.Get(0)));
    second.Append(0, 2, "de");
    EXPECT_EQ(first.Get(0).Impl()->Content(), "abc");
    EXPECT_EQ(second.Get(0).Impl()->Content(), "abcde");
    // A reader holds its record: a later change through the list is not seen.
    QORA_ExtensionReader reader(second.Get(0));
    second.Append(0, 1, "f");
    EXPECT_EQ(reader.ElementCount(), 5);
    second.Append(0, 0, nullptr);
    EXPECT_EQ(second.Get(0).Impl()->ElementCount(), 6);
}

TEST(ExtensionTest, PreconditionsAreAssertions) {
    QORA_ExtensionList list;
    EXPECT_THROW(list.SetContent(-1, 1, 1, "x"), ErrorText);
    EXPECT_THROW(list.SetContent(1, 1, -1, "x"), ErrorText);
    EXPECT_THROW(list.SetContent(1, 1, 1, nullptr), ErrorText);
    EXPECT_THROW(list.Append(1, 1, "x"), ErrorText);
    list.SetContent(1, 1, 1, "x");
    EXPECT_THROW(list.Append(1, -1, "x"), ErrorText);
}

TEST(ExtensionTest, RecordsFromAFileAreChecked) {
    QORA_ExtensionList list;
    list.Import(12, 8, std::string(16, 'z'));
    EXPECT_EQ(list.Get(12).Impl()->ElementCount(), 2);
    const std::pair<int32_t, int32_t> bad[] = {
        {-1, 1}, {QORA_ExtensionList::eMaxExtensionType + 1, 1}, {0x7fffffff, 1}, {5, 0}, {5, -3}};
    for (auto [type, size] : bad) {
        try {
            list.Import(type, size, "abcd");
            ADD_FAILURE() << type << " " << size;
        } catch (const SystemFileException& e) {
            EXPECT_EQ(e.Number(), kErrBadFormat);
        }
    }
    EXPECT_EQ(list.TypeBound(), 22);
    list.Import(12, 1, "");
    EXPECT_FALSE(list.HasExtension(12));
}

}  // namespace
