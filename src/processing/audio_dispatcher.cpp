#include "processing/audio_dispatcher.h"

#include <algorithm>
#include <chrono>

namespace orv {

unsigned countWorkerThreads(unsigned physicalCores, unsigned logicalProcessors) {
    return std::max(2U, physicalCores + logicalProcessors);
}

AudioDispatcher::AudioDispatcher(platform::ThreadPool& pool, Analysis analysis, Options options)
    : pool_(pool), analysis_(std::move(analysis)), options_(std::move(options)) {}

AudioDispatcher::~AudioDispatcher() { waitForAll(); }

void AudioDispatcher::dispatch(std::unique_ptr<AudioBlock> block) {
    if (!block || block->periodCount() == 0) return;
    block->sequence = nextSequence_++;
    if (!analysis_) return;  // nothing to analyse: the block has been seen, and goes
    if (options_.reverseOrder) {
        held_.push_back(std::move(block));
        return;
    }
    queue(std::move(block));
}

void AudioDispatcher::queue(std::shared_ptr<AudioBlock> block) {
    {
        // Wait until one more work item may be in flight. The memory guard is polled, since
        // memory can also fall without a work item ending; with nothing in flight it has no
        // block to wait for and lets the next one go.
        std::unique_lock<std::mutex> lock(mutex_);
        const auto mayQueue = [this] {
            if (inFlight_ > options_.workerLimit) return false;
            return inFlight_ == 0 || !options_.residentBytes ||
                   options_.residentBytes() <= kMemoryLimit;
        };
        while (!mayQueue()) finished_.wait_for(lock, std::chrono::milliseconds(20));
        ++inFlight_;
        peakInFlight_ = std::max(peakInFlight_, inFlight_);
    }
    auto work = [this, block = std::move(block)]() mutable {
        try {
            analysis_(*block);
        } catch (...) {
            // The analysis reports its own failures; nothing may stop the count below.
        }
        block.reset();  // the block's memory goes before the next may be queued
        std::lock_guard<std::mutex> lock(mutex_);
        --inFlight_;
        // Notified under the lock: a waiter cannot return and destroy the dispatcher while
        // this item still uses it.
        finished_.notify_all();
    };
    if (!pool_.submit(work)) work();
}

void AudioDispatcher::waitForAll() {
    while (!held_.empty()) {
        std::shared_ptr<AudioBlock> last = std::move(held_.back());
        held_.pop_back();
        queue(std::move(last));
    }
    std::unique_lock<std::mutex> lock(mutex_);
    finished_.wait(lock, [this] { return inFlight_ == 0; });
}

unsigned AudioDispatcher::peakInFlight() const {
    std::lock_guard<std::mutex> lock(mutex_);
    return peakInFlight_;
}

}  // namespace orv
