#include <gtest/gtest.h>

#include <cstring>
#include <memory>
#include <vector>

#include "case.h"
#include "memory_source.h"
#include "specialvalues.h"

namespace {

class Recorder : public QORA_DataSource::Observer {
  public:
    void IteratorCreated(QORA_InputCaseIterator* iterator) override { seen.push_back(iterator); }
    std::vector<QORA_InputCaseIterator*> seen;
};

class IteratorTest : public ::testing::Test {
  protected:
    IteratorTest() {
        source.Add(0, "N");
        source.Add(12, "S");
        source.AddRow([](QORA_Case& row) {
            row.SetNumeric(0, 1.5);
            row.SetString(1, "first");
        });
        source.AddRow([](QORA_Case& row) { row.SetNumeric(0, 2.5); });
    }
    MemorySource source;
};

}  // namespace

TEST_F(IteratorTest, EveryNewIteratorIsAnnouncedOnce) {
    Recorder a, b;
    source.AddObserver(&a);
    source.AddObserver(&b);
    std::unique_ptr<QORA_InputCaseIterator> one(source.NewIterator(nullptr));
    std::unique_ptr<QORA_InputCaseIterator> two(source.NewIterator(nullptr));
    EXPECT_EQ(a.seen, (std::vector<QORA_InputCaseIterator*>{one.get(), two.get()}));
    EXPECT_EQ(b.seen, a.seen);

    source.RemoveObserver(&a);
    std::unique_ptr<QORA_InputCaseIterator> three(source.NewIterator(nullptr));
    EXPECT_EQ(a.seen.size(), 2u);
    EXPECT_EQ(b.seen.size(), 3u);
}

TEST_F(IteratorTest, CallerBufferIsFilledAndOutlivesTheIterator) {
    auto buffer = std::make_unique<double[]>(3);
    {
        std::unique_ptr<QORA_InputCaseIterator> it(source.NewIterator(buffer.get()));
        EXPECT_FALSE(it->Case().OwnsBuffer());
        ASSERT_TRUE(it->ReadCase());
    }
    EXPECT_EQ(buffer[0], 1.5);
    EXPECT_EQ(std::memcmp(&buffer[1], "first       ", 12), 0);
}

TEST_F(IteratorTest, ReadsSeeksAndForwardsEditsToItsCase) {
    std::unique_ptr<QORA_InputCaseIterator> it(source.NewIterator(nullptr));
    EXPECT_EQ(&it->DataSource(), &source);
    ASSERT_TRUE(it->SeekCase(1));
    EXPECT_EQ(it->TellCase(), 1);
    ASSERT_TRUE(it->ReadCase());
    EXPECT_EQ(*static_cast<double*>(it->ValuePointer(0)), 2.5);
    EXPECT_FALSE(it->ReadCase());

    it->SetString(1, "edited", 3);
    EXPECT_EQ(std::memcmp(it->ValuePointer(1), "edi             ", 16), 0);
    it->SetNumeric(0, 8.0);
    EXPECT_EQ(*static_cast<double*>(it->Case().Buffer()), 8.0);
    it->ClearAll();
    EXPECT_EQ(*static_cast<double*>(it->ValuePointer(0)), SysmisValue());
}

TEST_F(IteratorTest, SettingTravelsDownTheLinks) {
    std::unique_ptr<QORA_InputCaseIterator> top(source.NewIterator(nullptr));
    std::unique_ptr<QORA_InputCaseIterator> middle(source.NewIterator(nullptr));
    std::unique_ptr<QORA_InputCaseIterator> bottom(source.NewIterator(nullptr));
    middle->Link(bottom.get());
    EXPECT_EQ(bottom->Case().GetSetting(), 0);

    top->ForwardSetting(7);
    EXPECT_EQ(top->Case().GetSetting(), 7);
    EXPECT_EQ(middle->Case().GetSetting(), 0);  // not linked yet
    top->Link(middle.get());
    EXPECT_EQ(top->Case().GetLink(), middle.get());
    EXPECT_EQ(middle->Case().GetSetting(), 7);
    EXPECT_EQ(bottom->Case().GetSetting(), 7);

    top->ForwardSetting(-3);
    EXPECT_EQ(bottom->Case().GetSetting(), -3);
    top->Link(nullptr);
    top->ForwardSetting(5);
    EXPECT_EQ(middle->Case().GetSetting(), -3);
}
