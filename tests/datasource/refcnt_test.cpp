#include "refcnt.h"

#include <gtest/gtest.h>

namespace {

int gLive = 0;

struct Counted : QORA_RefCntObject {
    explicit Counted(int v) : value(v) { ++gLive; }
    Counted(const Counted& other) : QORA_RefCntObject(other), value(other.value) { ++gLive; }
    ~Counted() override { --gLive; }
    int value;
};

using Ref = QORA_CowRef<Counted>;

TEST(RefCntTest, CopiesShareUntilOneChanges) {
    {
        Ref a(new Counted(1));
        Ref b = a;
        EXPECT_TRUE(a.SameObject(b));
        EXPECT_EQ(a->RefCount(), 2);
        b.Mutable()->value = 2;
        EXPECT_FALSE(a.SameObject(b));
        EXPECT_EQ(a->value, 1);
        EXPECT_EQ(b->value, 2);
        EXPECT_EQ(gLive, 2);
        Counted* before = b.Mutable();  // a sole owner changes in place
        EXPECT_EQ(b.Mutable(), before);
    }
    EXPECT_EQ(gLive, 0);
}

TEST(RefCntTest, UnshareableObjectIsCopiedOnHandleCopy) {
    {
        Ref a(new Counted(7));
        a.Mutable()->MarkUnshareable();
        Ref b = a;
        EXPECT_FALSE(a.SameObject(b));
        EXPECT_EQ(b->value, 7);
        EXPECT_TRUE(b->IsShareable());
        Ref c;
        c = a;
        EXPECT_FALSE(c.SameObject(a));
        EXPECT_EQ(gLive, 3);
    }
    EXPECT_EQ(gLive, 0);
}

TEST(RefCntTest, AssignmentReleasesAndSelfAssignmentKeeps) {
    {
        Ref a(new Counted(1));
        Ref b(new Counted(2));
        a = b;
        EXPECT_EQ(gLive, 1);
        const Ref& alias = a;
        a = alias;
        EXPECT_EQ(a->value, 2);
        Ref moved = std::move(a);
        EXPECT_FALSE(a.IsValid());
        EXPECT_EQ(moved->RefCount(), 2);
        moved.Reset();
        EXPECT_EQ(b->RefCount(), 1);
        Ref null;
        EXPECT_THROW(null.Mutable(), ErrorText);
        EXPECT_THROW(null->value, ErrorText);
    }
    EXPECT_EQ(gLive, 0);
}

}  // namespace
