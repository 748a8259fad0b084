#include "sparsefileindex.h"

#include <gtest/gtest.h>

#include "dserror.h"

namespace {

void ExpectEntry(const SparseFileIndex::Entry& entry, int64_t caseNumber, int64_t position) {
    EXPECT_EQ(entry.caseNumber, caseNumber);
    EXPECT_EQ(entry.position, position);
}

// Cases of a fixed compressed size, offered in order from the start.
void OfferCases(SparseFileIndex& index, int64_t count, int64_t caseBytes) {
    for (int64_t c = 0; c < count; ++c) index.Offer(c, c * caseBytes);
}

}  // namespace

TEST(SparseFileIndex, OfferKeepsOneEntryPerSpacing) {
    EXPECT_EQ(SparseFileIndex(100).Spacing(), 40u);  // the default 4096 shared out
    EXPECT_THROW(SparseFileIndex(0), ErrorText);
    SparseFileIndex index;
    ExpectEntry(index.Lookup(1000), 0, 0);  // empty: the start of the data
    OfferCases(index, 100, 100);            // 9900 bytes
    ASSERT_EQ(index.Count(), 3u);
    ExpectEntry(index.At(1), 41, 4100);
    ExpectEntry(index.At(2), 82, 8200);
    index.Offer(50, 5000);  // not beyond the last position: ignored
    EXPECT_EQ(index.Count(), 3u);
    EXPECT_EQ(index.LastPosition(), 9900);

    SparseFileIndex wide;  // a long case widens the spacing
    wide.Offer(0, 0);
    wide.Offer(1, 10000);
    EXPECT_EQ(wide.Spacing(), 10000u);
    wide.Offer(2, 15000);  // closer than the new spacing
    EXPECT_EQ(wide.Count(), 2u);
}

TEST(SparseFileIndex, ThinsToHalfAndDoublesTheSpacing) {
    SparseFileIndex index;
    // Entries every 4096 bytes; the 256th entry reaches spacing / 16.
    OfferCases(index, 256, 4096);
    EXPECT_EQ(index.Count(), 128u);
    EXPECT_EQ(index.Spacing(), 8192u);
    for (size_t i = 0; i < index.Count(); ++i) ExpectEntry(index.At(i), 2 * i, 2 * i * 4096);

    // Long runs stay small: about the square root of the data size.
    SparseFileIndex big;
    OfferCases(big, 1000000, 50);
    EXPECT_LT(big.Count() * 16, big.Spacing());
    EXPECT_GT(big.Count(), 100u);
}

TEST(SparseFileIndex, LookupFindsTheLastEntryAtOrBefore) {
    SparseFileIndex index;
    OfferCases(index, 1000, 1000);  // an entry every 5 cases from case 0
    ASSERT_GT(index.Count(), 100u);
    for (int64_t r : {0, 1, 4, 5, 6, 499, 500, 501, 994, 995, 999, 5000}) {
        const SparseFileIndex::Entry found = index.Lookup(r);
        EXPECT_LE(found.caseNumber, r);
        EXPECT_EQ(found.position, found.caseNumber * 1000);
        size_t k = 0;
        while (k + 1 < index.Count() && index.At(k + 1).caseNumber <= r) ++k;
        EXPECT_EQ(found.caseNumber, index.At(k).caseNumber) << r;
    }
}

TEST(SparseFileIndex, LookupBelowTheFirstEntryIsTheStart) {
    SparseFileIndex index;
    index.Offer(10, 500);  // the first case offered is not case 0
    index.Offer(20, 9000);
    // In this order the remembered entry answers again, and a miss searches anew.
    const int64_t rows[][3] = {
        {5, 0, 0}, {15, 10, 500}, {25, 20, 9000}, {19, 10, 500}, {20, 20, 9000}};
    for (const auto& r : rows) ExpectEntry(index.Lookup(r[0]), r[1], r[2]);
}
