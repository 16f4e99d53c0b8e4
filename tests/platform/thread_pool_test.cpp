#include "platform/thread_pool.h"

#include <gtest/gtest.h>

#include <atomic>
#include <set>
#include <thread>

namespace {

TEST(ThreadPool, EveryQueuedItemRunsBeforeJoinReturns) {
    std::atomic<int> done{0};
    std::mutex m;
    std::set<std::thread::id> threads;
    {
        platform::ThreadPool pool(3);
        for (int i = 0; i < 200; ++i) {
            ASSERT_TRUE(pool.submit([&] {
                {
                    std::lock_guard<std::mutex> lock(m);
                    threads.insert(std::this_thread::get_id());
                }
                done.fetch_add(1);
            }));
        }
        pool.join();
        EXPECT_EQ(done.load(), 200);
        EXPECT_FALSE(pool.submit([] {}));
    }
    EXPECT_LE(threads.size(), 3U);
    EXPECT_EQ(threads.count(std::this_thread::get_id()), 0U);
}

}  // namespace
