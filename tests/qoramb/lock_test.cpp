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

// Ownership goes by thread id: another thread is refused until every entry is left.
TEST(CriticalSectionExt, TryEnter) {
    CriticalSectionExt section;
    auto otherGets = [&] {
        bool got = false;
        std::thread([&] {
            if ((got = section.TryEnter())) section.Leave();
        }).join();
        return got;
    };
    ASSERT_TRUE(section.TryEnter());
    ASSERT_TRUE(section.TryEnter());  // the owner again
    EXPECT_FALSE(otherGets());
    section.Leave();
    EXPECT_FALSE(otherGets());  // still held once
    section.Leave();
    EXPECT_TRUE(otherGets());
    section.Enter();
    section.Leave();
}

}  // namespace
