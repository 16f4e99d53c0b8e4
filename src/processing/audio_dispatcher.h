// Hands dispatched audio blocks to the analysis on the run's worker threads, within the
// worker limit and the memory guard, and waits for them at the end of a session.
#pragma once

#include <condition_variable>
#include <cstdint>
#include <functional>
#include <memory>
#include <mutex>
#include <vector>

#include "platform/thread_pool.h"
#include "processing/audio_block.h"

namespace orv {

// Work items allowed in flight before the next may be queued: the physical cores plus the
// logical processors, at least 2.
unsigned countWorkerThreads(unsigned physicalCores, unsigned logicalProcessors);

class AudioDispatcher {
public:
    // Runs on a worker thread, once per block; the block is released when it returns.
    using Analysis = std::function<void(AudioBlock&)>;
    // Bytes of the process resident in memory.
    using ResidentBytes = std::function<std::uint64_t()>;

    // While the process holds more than this, no further block is queued (unless nothing
    // is in flight, so the wait always ends).
    static constexpr std::uint64_t kMemoryLimit = 512ULL * 1024 * 1024;

    struct Options {
        unsigned workerLimit = 2;  // up to workerLimit + 1 blocks in flight
        ResidentBytes residentBytes;
        // Holds every block until the end of the session and then queues them last first,
        // so that they finish in reverse order (tests of the result order).
        bool reverseOrder = false;
    };

    AudioDispatcher(platform::ThreadPool& pool, Analysis analysis, Options options);
    AudioDispatcher(const AudioDispatcher&) = delete;
    AudioDispatcher& operator=(const AudioDispatcher&) = delete;
    // Waits for every block still in flight.
    ~AudioDispatcher();

    // Numbers the block (0, 1, ... per dispatcher) and queues it as soon as one more work
    // item may be in flight. A block without periods is not queued. Driver thread only.
    void dispatch(std::unique_ptr<AudioBlock> block);
    // Returns when every dispatched block has been analysed.
    void waitForAll();

    std::uint64_t dispatchedCount() const { return nextSequence_; }
    // The most work items that were ever in flight at once.
    unsigned peakInFlight() const;

private:
    void queue(std::shared_ptr<AudioBlock> block);

    platform::ThreadPool& pool_;
    Analysis analysis_;
    Options options_;
    std::uint64_t nextSequence_ = 0;
    std::vector<std::shared_ptr<AudioBlock>> held_;

    mutable std::mutex mutex_;
    std::condition_variable finished_;
    unsigned inFlight_ = 0;
    unsigned peakInFlight_ = 0;
};

}  // namespace orv
