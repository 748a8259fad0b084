// The recursive, thread-owned locks.
#include <gtest/gtest.h>

#include <atomic>
#include <chrono>
#include <thread>

#include "qoralock.h"

namespace {

TEST(CriticalSection, RecursiveOnOneThreadExclusiveAcrossThreads) {
    CriticalSection section;
    std::atomic<bool> entered{false};
    std::thread other;
    {
        CriticalSection::Lock outer(section);
        CriticalSection::Lock inner(section);
        other = std::thread([&] {
            CriticalSection::Lock lock(section);
            entered = true;
        });
        std::this_thread::sleep_for(std::chrono::milliseconds(50));
        EXPECT_FALSE(entered);
    }
    other.join();
    EXPECT_TRUE(entered);
}

TEST(CriticalSectionExt, TryEnter) {
    CriticalSectionExt section;
    ASSERT_TRUE(section.TryEnter());
    ASSERT_TRUE(section.TryEnter());  // the owner again
    bool otherGot = true;
    std::thread([&] { otherGot = section.TryEnter(); }).join();
    EXPECT_FALSE(otherGot);
    section.Leave();
    std::thread([&] { otherGot = section.TryEnter(); }).join();
    EXPECT_FALSE(otherGot);  // still held once
    section.Leave();
    std::thread([&] {
        otherGot = section.TryEnter();
        if (otherGot) section.Leave();
    }).join();
    EXPECT_TRUE(otherGot);
    section.Enter();
    section.Leave();
}

TEST(CriticalSection, ThreadIdsDiffer) {
    uint32_t mine = CurrentThreadId();
    uint32_t theirs = 0;
    std::thread([&] { theirs = CurrentThreadId(); }).join();
    EXPECT_NE(mine, 0u);
    EXPECT_NE(theirs, 0u);
    EXPECT_NE(mine, theirs);
}

}  // namespace
