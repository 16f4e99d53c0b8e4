// A pool of worker threads owned by the run. Every queued item runs; the destructor (or
// join) waits for all of them.
#pragma once

#include <condition_variable>
#include <cstddef>
#include <deque>
#include <functional>
#include <mutex>
#include <thread>
#include <vector>

namespace platform {

class ThreadPool {
public:
    explicit ThreadPool(unsigned threads);
    ThreadPool(const ThreadPool&) = delete;
    ThreadPool& operator=(const ThreadPool&) = delete;
    ~ThreadPool();

    // Queues an item; false only when the pool has been joined.
    bool submit(std::function<void()> work);
    // Runs every queued item to its end, then stops the threads.
    void join();
    unsigned size() const { return static_cast<unsigned>(threads_.size()); }

private:
    void run();

    std::mutex mutex_;
    std::condition_variable wake_;
    std::deque<std::function<void()>> queue_;
    std::vector<std::thread> threads_;
    bool stopping_ = false;
};

}  // namespace platform
