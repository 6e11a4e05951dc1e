#include <gtest/gtest.h>

#include <atomic>
#include <string>

#include "platform/Event.h"
#include "platform/ModulePath.h"
#include "platform/Mutex.h"
#include "platform/Thread.h"

using namespace ulvetta;

TEST(Mutex, IsReentrantAndExcludesOtherThreads) {
    Mutex m;
    m.lock();
    m.lock();  // the holder may take it again
    std::atomic<bool> otherGotIt{true};
    Thread t;
    ASSERT_TRUE(t.start([&] { otherGotIt = m.tryLock(); }, 0));
    t.join();
    EXPECT_FALSE(otherGotIt.load());
    m.unlock();
    // Still held once: another thread is still excluded.
    ASSERT_TRUE(t.start([&] { otherGotIt = m.tryLock(); }, 0));
    t.join();
    EXPECT_FALSE(otherGotIt.load());
    m.unlock();
    ASSERT_TRUE(t.start([&] {
        otherGotIt = m.tryLock();
        if (otherGotIt) m.unlock();
    }, 0));
    t.join();
    EXPECT_TRUE(otherGotIt.load());
}

TEST(Mutex, SerialisesCounters) {
    Mutex m;
    long counter = 0;
    auto body = [&] {
        for (int i = 0; i < 100000; ++i) {
            MutexLock g(m);
            ++counter;
        }
    };
    Thread a, b;
    ASSERT_TRUE(a.start(body, 0));
    ASSERT_TRUE(b.start(body, 0));
    a.join();
    b.join();
    EXPECT_EQ(counter, 200000);
}

TEST(Event, AutoResetsAfterOneWait) {
    Event e;
    EXPECT_FALSE(e.waitFor(10));
    e.set();
    e.set();  // two sets with no waiter count once
    EXPECT_TRUE(e.waitFor(10));
    EXPECT_FALSE(e.waitFor(10));
}

TEST(Event, HandsJobsBetweenThreads) {
    Event trigger, done;
    std::atomic<bool> stop{false};
    int processed = 0;
    Thread worker;
    ASSERT_TRUE(worker.start([&] {
        for (;;) {
            trigger.wait();
            if (stop) break;
            ++processed;
            done.set();
        }
    }, 256 * 1024));
    for (int i = 0; i < 50; ++i) {
        trigger.set();
        done.wait();
    }
    stop = true;
    trigger.set();
    worker.join();
    EXPECT_EQ(processed, 50);
}

TEST(Thread, StartsWithRequestedStackAndRefusesSecondStart) {
    Thread t;
    EXPECT_FALSE(t.running());
    std::atomic<int> ran{0};
    // A stack large enough for a 1 MiB local array proves the size was honoured.
    ASSERT_TRUE(t.start([&] {
        volatile char big[1 << 20];
        big[0] = 1;
        big[sizeof(big) - 1] = 2;
        ran = big[0] + big[sizeof(big) - 1];
    }, 4u << 20));
    EXPECT_TRUE(t.running());
    EXPECT_FALSE(t.start([] {}, 0));
    t.join();
    EXPECT_FALSE(t.running());
    EXPECT_EQ(ran.load(), 3);
}

TEST(ModulePath, NamesThisExecutable) {
    std::string path = modulePath();
    ASSERT_FALSE(path.empty());
    EXPECT_NE(path.find("platform_tests"), std::string::npos);
    std::string dir = moduleDirectory();
    ASSERT_FALSE(dir.empty());
    EXPECT_TRUE(dir.back() == '/' || dir.back() == '\\');
    EXPECT_EQ(path.compare(0, dir.size(), dir), 0);
}
